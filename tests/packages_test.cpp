// The package steps: the commands that they run, the directories that they make, the version that they hand on.
#include <filesystem>

#include "launcher_fixture.h"

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

namespace fs = std::filesystem;

class Packages : public LauncherTest {};

TEST_F(Packages, OnlineCommandsCarryTheForwardedArguments) {
  EXPECT_EQ(Run({"--update", "-x", "two words", "--Proxy=1"}).status, 0);
  EXPECT_THAT(
      TraceLines("[Status:]CheckUpdate:TAVToolCmd = "),
      ElementsAre("\"@/tavtool\" compareweb -l \"@\" -m 1234 -o rhel5 -a 64 --latest -x \"two words\" --Proxy=1 "
                  "2>/dev/null 1>/dev/null 2>&1"));
  EXPECT_THAT(TraceLines("[Status:]AcquireUpdate: command = "),
              ElementsAre("mkdir -p /var/ZEM_Support 1>/dev/null 2>&1"));
  EXPECT_THAT(TraceLines("[Status:]AcquireUpdate: TAVToolCmd = "),
              ElementsAre("\"@/tavtool\" acquire -l \"/var/ZEM_Support\" -m 1234 -o rhel5 -a 64 --force --latest -x "
                          "\"two words\" --Proxy=1 2>/dev/null 1>/dev/null 2>&1"));
  EXPECT_THAT(CallsOf("tavtool"),
              ElementsAre("[compareweb][-l][@][-m][1234][-o][rhel5][-a][64][--latest][-x][two words][--Proxy=1]",
                          "[acquire][-l][/var/ZEM_Support][-m][1234][-o][rhel5][-a][64][--force][--latest][-x]"
                          "[two words][--Proxy=1]",
                          "[comparelocal][-l][/var/ZEM_Support][-s][@][-m][1234][-o][rhel5][-a][64]"));
  // With the directory there, and without the redirection of standard error.
  fs::remove(kTraceFile);
  Run({"--update", "--show_stderr"});
  EXPECT_THAT(TraceLines("[Status:]AcquireUpdate: command = "), IsEmpty());
  EXPECT_THAT(TraceLines("[Status:]CheckUpdate:TAVToolCmd = "),
              ElementsAre("\"@/tavtool\" compareweb -l \"@\" -m 1234 -o rhel5 -a 64 --latest 1>/dev/null 2>&1"));
}

// Each step makes the directories that it needs again, without a trace line but for the download's, and shows what it
// waits for when it waits.
TEST_F(Packages, DirectoriesThatGoAwayAndTextsThatWait) {
  InstallCopyScript();
  Install("tavtool",
          "cp ../stdout ../stdout.$1; ls -d /var/ZEM_Support >>../seen\n"
          "case $1 in acquire) rmdir /var/ZEM_Support ;; comparelocal) rmdir /var/ZEM_Support; exit 21 ;; esac");
  Run({"--update"});
  EXPECT_THAT(CallsOf("tavtool"), ::testing::SizeIs(4));
  EXPECT_EQ(ReadFile(Directory() + "/seen"), "/var/ZEM_Support\n/var/ZEM_Support\n/var/ZEM_Support\n");
  const std::string trace = Trace();
  EXPECT_THAT(trace, HasSubstr("AcquireUpdate: command = mkdir"));
  EXPECT_EQ(trace.find("mkdir"), trace.rfind("mkdir"));
  EXPECT_THAT(ReadFile(Directory() + "/stdout.acquire"), ::testing::EndsWith("please wait...\n"));
  EXPECT_THAT(ReadFile(Directory() + "/stdout.expand"),
              ::testing::EndsWith("downloading...Applying update(s) please wait..."));
}

TEST_F(Packages, VersionHandedToTheCopyScript) {
  fs::create_directory(kRepository);
  InstallCopyScript();
  const std::pair<std::string, std::string> rows[] = {
      {"Name=pack\nVersion=2.31a\nVersion=9.99\n", "[2.31]"},
      {"Version=9\n", "[9]"},
      {"Version=\nVersion=1.23\n", ""},
      {"PackageVersion=1.05", "[1.05]"},
      {"VersioVersion=3.00 Version=4", "[3.00]"},
      {"Version =1\nversion=2\nVersion\n=3", ""},
      {std::string(70000, 'V') + "ersion=1.2\n", "[1.2]"},
      {"Version=1 23", "[1][23]"},
      {"", ""},
  };
  for (const auto& [output, arguments] : rows) {
    SCOPED_TRACE(output.substr(0, 60));
    WriteFile(Directory() + "/output", output);
    Install("tavtool", "[ \"$1\" != comparelocal ] || { cat '" + Directory() + "/output'; exit 21; }");
    fs::remove(Directory() + "/calls.copy.sh");
    Run({});
    EXPECT_THAT(CallsOf("copy.sh"), ElementsAre("[/tmp/tav][@][/var/ZEM_Support]" + arguments));
  }
  const Strings commands = TraceLines("[Status:]CopyTAVToRUVFoler: command = ");
  EXPECT_EQ(commands.back(),
            "\"/tmp/tav/ruv/data/copy.sh\" \"/tmp/tav\" \"@\" \"/var/ZEM_Support\"  "
            "1>>/var/log/ZEM_Support/ruvtav.log 2>&1");
}

TEST_F(Packages, ExpansionAndInstallation) {
  const std::string start =
      "Discovered RUV update(s) in local drive for this system.\nApplying update(s) please wait...";
  const std::string missing = "[Status:]CopyTAVToRUVFoler: script file \"/tmp/tav/ruv/data/copy.sh\" does not exist!";
  const std::string failed = "[Status:]DecompressTAV: Failed to copy TAV to RUV Folder!";
  const std::string success = "[Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!";
  enum Script { kNone, kFile, kFailing, kDirectory };
  struct Row {
    std::string what;
    int exit_code;
    Script script;
    std::string out;
    Strings copy_calls;
    Strings traced;
    bool listed;
  };
  const Row rows[] = {
      {"no payload", 52, kFile, "Done\n", {"[/tmp/tav][@][NO_TAV_PAYLOAD]"}, {success}, true},
      {"no payload", 61, kFile, "Done\n", {"[/tmp/tav][@][NO_TAV_PAYLOAD]"}, {success}, true},
      {"success", 32, kFailing, "Done\n", {"[/tmp/tav][@][/var/ZEM_Support]"}, {success}, true},
      {"no script", 0, kNone, "Failed\n", {}, {missing, failed}, false},
      {"directory", 52, kDirectory, "Failed\n", {}, {missing, failed}, false},
      {"silent failure", 21, kFile, "", {}, {}, false},
      {"failure", 1, kFile, "Invalid command parameter specified.\n", {}, {}, false},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.what);
    TearDown();
    SetUp();
    fs::create_directory(kRepository);
    InstallTool({{"comparelocal", 21}, {"expand", row.exit_code}});
    if (row.script == kFile) InstallCopyScript();
    if (row.script == kFailing) InstallCopyScript("exit 3");
    if (row.script == kDirectory) fs::create_directories("/tmp/tav/ruv/data/copy.sh");
    EXPECT_EQ(Run({}).out, start + row.out);
    EXPECT_EQ(CallsOf("copy.sh"), row.copy_calls);
    for (const std::string& line : {missing, failed, success}) {
      const bool expected = std::find(row.traced.begin(), row.traced.end(), line) != row.traced.end();
      EXPECT_EQ(TraceLines(line).size(), expected ? 1U : 0U) << line;
    }
    EXPECT_EQ(ReadFile(Directory() + "/data/supportlist.xml") != "<MT>1234</MT>\n", row.listed);
    EXPECT_TRUE(fs::is_directory(kExpansionDirectory));
    EXPECT_THAT(CallsOf("ruv"), ElementsAre(""));
  }
}

TEST_F(Packages, PortableMedia) {
  const std::string media = Directory() + "/portable media";
  const RunOptions portable = Environment("ZEM_PORTABLE_EXEC_DIR", media);
  const std::string member = "[Status:]CopyPortableTAVToRepository: ";

  // No update folder: nothing is imported, and without a repository nothing is compared.
  Run({}, portable);
  EXPECT_THAT(TraceLines(member), ElementsAre("The directory <Portable>/update does not Exist!"));
  EXPECT_THAT(CallsOf("tavtool"), IsEmpty());
  EXPECT_FALSE(fs::exists(kRepository));

  fs::remove(kTraceFile);
  fs::create_directories(media + "/update");
  InstallTool({{"copy", 51}});
  EXPECT_THAT(Run({}, portable).out, HasSubstr("package corrupted"));
  const std::string command =
      "TAVToolCmd = \"@/tavtool\" copy -l \"@/portable media/update\" -t \"/var/ZEM_Support\" -m 1234 -o "
      "rhel5 -a 64 "
      "1>/dev/null 2>&1";
  EXPECT_THAT(TraceLines(member), ElementsAre("command = mkdir -p /var/ZEM_Support 1>/dev/null 2>&1", command));
  EXPECT_THAT(CallsOf("tavtool"),
              ElementsAre("[copy][-l][@/portable media/update][-t][/var/ZEM_Support][-m][1234][-o][rhel5][-a][64]",
                          "[comparelocal][-l][/var/ZEM_Support][-s][@][-m][1234][-o][rhel5][-a][64]"));

  // The repository is there now; forwarded arguments are not the copy's business.
  fs::remove(kTraceFile);
  Run({"-v"}, portable);
  EXPECT_THAT(TraceLines(member), ElementsAre(command));

  // A download goes to the media, whatever the blank in its path did to the bare mkdir.
  fs::remove(kTraceFile);
  fs::remove(media + "/update");
  Run({"--update"}, portable);
  EXPECT_THAT(TraceLines("[Status:]AcquireUpdate: command = "),
              ElementsAre("mkdir -p @/portable media/update 1>/dev/null 2>&1"));
  EXPECT_THAT(CallsOf("tavtool").back(),
              "[acquire][-l][@/portable media/update][-m][1234][-o][rhel5][-a][64][--force][--latest]");
}
