// Which steps a run takes, in which order, and what the user and the trace see of them.
#include <filesystem>

#include "launcher_fixture.h"

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::SizeIs;

namespace fs = std::filesystem;

class RunSequence : public LauncherTest {};

// The whole trace of one run: what the user's example looks like from start to end.
TEST_F(RunSequence, LaunchInstallsAPackageFromTheRepositoryAndStartsTheApplication) {
  fs::create_directory(kRepository);
  WriteFile(Directory() + "/data/supportlist.xml", "<MT>9999</MT>\n");
  InstallTool({{"comparelocal", 21}}, "Name=pack\nVersion=2.31a\n");
  InstallCopyScript("echo copied; echo oops >&2");
  Install("ruv", "echo application; echo hidden >&2; exit 9");

  const RunResult run = Run({"-v"});

  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out,
            "Discovered RUV update(s) in local drive for this system.\n"
            "Applying update(s) please wait...Done\n"
            "application\n");
  EXPECT_THAT(CallsOf("tavtool"),
              ElementsAre("[comparelocal][-l][/var/ZEM_Support][-s][@][-m][1234][-o][rhel5][-a][64]",
                          "[expand][-l][/var/ZEM_Support][-t][/tmp/tav][-m][1234][-o][rhel5][-a][64]"));
  EXPECT_THAT(CallsOf("copy.sh"), ElementsAre("[/tmp/tav][@][/var/ZEM_Support][2.31]"));
  EXPECT_THAT(CallsOf("ruv"), ElementsAre("[-v]"));
  EXPECT_EQ(ReadFile(Directory() + "/data/supportlist.xml"), "<MT>9999</MT>\n\n<MT>1234</MT>");
  EXPECT_EQ(fs::status("/tmp/tav/ruv/data/copy.sh").permissions(), fs::perms::all);
  EXPECT_EQ(Trace(), R"trace([TAVRUV]: [Debug:] Enter: TAVMaster::TAVMaster()
[TAVRUV]: [Debug:] Entering TAVMaster::GetTAVBinaryPath()
[TAVRUV]: [Debug:] Exiting TAVMaster::GetTAVBinaryPath()
[TAVRUV]: [Status:]TAVMaster: command = @/guihelper.sh 1>/dev/null 2>&1
[TAVRUV]: [Debug:] Entering TAVMaster::OSMapping(), code = 203
[TAVRUV]: [Debug:] Exiting TAVMaster::OSMapping()
[TAVRUV]: [Debug:] Entering TAVMaster::TAVMasterGetSupportList()
[TAVRUV]: [Debug:] Exiting TAVMaster::TAVMasterGetSupportList()
[TAVRUV]: [Status:]OS = rhel5
[TAVRUV]: [Status:]MT = 1234
[TAVRUV]: [Status:]ARCH = 64
[TAVRUV]: [Status:]Working Path = @
[TAVRUV]: [Status:]Repository Path = /var/ZEM_Support
[TAVRUV]: [Status:]TAV Uncompressed Path = /tmp/tav
[TAVRUV]: [Debug:] Exiting TAVMaster::TAVMaster()
[TAVRUV]: [Debug:] Entering TAVMaster::TAVMasterMain()
[TAVRUV]: [Debug:] Entering TAVMaster::ParseParameters()
[TAVRUV]: [Debug:] Exiting TAVMaster::ParseParameters()
[TAVRUV]: [Status:]This is not portable version of RUV
[TAVRUV]: [Debug:] Entering TAVMaster::CompareTAVPackage()
[TAVRUV]: [Status:]CompareTAVPackage: TAVToolCmd = "@/tavtool" comparelocal -l "/var/ZEM_Support" -s "@" -m 1234 -o rhel5 -a 64 1>tav.log 2>&1
[TAVRUV]: [Status:]Return Code from tavtool = 21
[TAVRUV]: [Debug:] Exiting TAVMaster::CompareTAVPackage()
[TAVRUV]: [Debug:] Entering TAVMaster::DecompressTAV()
[TAVRUV]: [Status:]DecompressTAV: TAVToolCmd = @/tavtool expand -l "/var/ZEM_Support" -t "/tmp/tav" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1
[TAVRUV]: [Status:]Return Code from tavtool = 0
[TAVRUV]: [Debug:] Entering TAVMaster::CopyTAVToRUVFoler()
[TAVRUV]: [Status:]CopyTAVToRUVFoler: command = "/tmp/tav/ruv/data/copy.sh" "/tmp/tav" "@" "/var/ZEM_Support" 2.31 1>>/var/log/ZEM_Support/ruvtav.log 2>&1
copied
oops
[TAVRUV]: [Debug:] Exiting TAVMaster::CopyTAVToRUVFoler()
[TAVRUV]: [Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!
[TAVRUV]: [Debug:] Exiting TAVMaster::DecompressTAV()
[TAVRUV]: [Debug:] Entering TAVMaster::InvokeRUV()
[TAVRUV]: [Status:]InvokeRUV: command = "@/ruv" -v 2>/dev/null
[TAVRUV]: [Debug:] Exiting TAVMaster::InvokeRUV()
[TAVRUV]: [Debug:] Exiting TAVMaster::TAVMasterMain()
[TAVRUV]: [Debug:] Entering TAVMaster::~TAVMaster()
[TAVRUV]: [Debug:] Exiting TAVMaster::~TAVMaster()
)trace");
}

// One row: a command line, what the tool answers, and which steps follow.
TEST_F(RunSequence, UpdateModeStopsWhereAStepFailsAndNeverStartsTheApplication) {
  struct Row {
    std::string what;
    std::string option;
    bool portable;
    std::map<std::string, int> tool;
    std::string out;  // behind the first line, which all rows share
    Strings verbs;
    bool listed;  // the machine type was appended to the support list
  };
  const std::string detected = "RUV update(s) detected, start downloading...";
  const std::string there = "There's new update for this system, use --update to download\n";
  const std::string latest = "You already have the latest version RUV.\n";
  const std::string no_kro = detected + "Couldn't ping KRO, maybe the KRO is down.\nFailed\n";
  const std::string applying = detected + "Applying update(s) please wait...";
  const std::string corrupted = applying +
                                "Error, package corrupted or not enough free space on disk.\n"
                                "Ensure that there is enough system disk space and have written permissions.\nDone\n";
  const Strings check = {"compareweb"};
  const Strings download = {"compareweb", "acquire"};
  const Strings compare = {"compareweb", "acquire", "comparelocal"};
  const Strings all = {"compareweb", "acquire", "comparelocal", "expand"};
  const Row rows[] = {
      {"check, update there", "--chkupd", false, {}, there, check, false},
      {"check, none", "--chkupd", false, {{"compareweb", 30}}, latest, check, false},
      {"check, package result", "--CHKUPD", false, {{"compareweb", 21}}, "", check, false},
      {"update, none", "--update", false, {{"compareweb", 2}}, "", check, false},
      {"download fails", "--update", false, {{"acquire", 77}}, detected + "Failed\n", download, false},
      {"download fails, with a message", "--update", false, {{"acquire", 45}}, no_kro, download, false},
      {"nothing newer", "--update", false, {{"compareweb", 32}, {"acquire", 32}}, detected + "Done\n", compare, false},
      {"latest", "--update", false, {{"comparelocal", 30}}, detected + latest + "Done\n", compare, false},
      {"no payload", "--update", false, {{"comparelocal", 52}}, detected + "Done\n", compare, false},
      {"installed", "--Update", false, {{"comparelocal", 21}}, applying + "Done\nDone\n", all, true},
      {"expansion fails", "--update", false, {{"comparelocal", 21}, {"expand", 51}}, corrupted, all, false},
      {"portable", "--update", true, {{"comparelocal", 21}}, detected + "Done\n", download, false},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.what);
    TearDown();
    SetUp();
    InstallTool(row.tool);
    InstallCopyScript();
    RunOptions options;
    if (row.portable) options.environment["ZEM_PORTABLE_EXEC_DIR"] = Directory() + "/media";

    const RunResult run = Run({row.option}, options);

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, "Detecting available update on internet, please wait...\n" + row.out);
    Strings verbs;
    for (const std::string& call : CallsOf("tavtool")) verbs.push_back(call.substr(1, call.find(']') - 1));
    EXPECT_EQ(verbs, row.verbs);
    EXPECT_THAT(CallsOf("ruv"), IsEmpty());
    EXPECT_EQ(ReadFile(Directory() + "/data/supportlist.xml") == "<MT>1234</MT>\n\n<MT>1234</MT>", row.listed);
    EXPECT_THAT(Trace(), HasSubstr("[Debug:] Exiting TAVMaster::TAVMasterMain()\n"
                                   "[TAVRUV]: [Debug:] Entering TAVMaster::~TAVMaster()\n"
                                   "[TAVRUV]: [Debug:] Exiting TAVMaster::~TAVMaster()\n"));
  }
}

TEST_F(RunSequence, LaunchModeLooksForPackagesOnlyWhereItMay) {
  struct Row {
    std::string what;
    Strings arguments;
    bool repository;
    Strings verbs;
  };
  const Row rows[] = {
      {"no repository", {}, false, {}},
      {"repository", {}, true, {"comparelocal"}},
      {"packages ignored", {"--VMware-ESXi", "host"}, true, {}},
      {"packages ignored, other option", {"--ipmi-lan"}, true, {}},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.what);
    TearDown();
    SetUp();
    if (row.repository) fs::create_directory(kRepository);
    InstallTool({{"comparelocal", 52}});  // no payload is nothing to install here
    const RunResult run = Run(row.arguments);
    EXPECT_EQ(run.out, "");
    Strings verbs;
    for (const std::string& call : CallsOf("tavtool")) verbs.push_back(call.substr(1, call.find(']') - 1));
    EXPECT_EQ(verbs, row.verbs);
    EXPECT_THAT(CallsOf("ruv"), SizeIs(1));
    EXPECT_EQ(fs::exists(kRepository), row.repository);
  }
}

TEST_F(RunSequence, SearchPathsAreExtendedForEveryProgram) {
  const std::string libraries = "./:./qlogic/qcccli/:./qlogic/:./fibre/:./megalsi:./mellanox:./nvidia";
  struct Row {
    std::optional<std::string> library_path;
    std::string library_path_after;
    std::string path;
  };
  const Row rows[] = {
      {std::nullopt, libraries, "/usr/bin:/bin"},
      {"", ":" + libraries, "/bin:./mellanox"},
      {"/usr/lib", "/usr/lib:" + libraries, "/usr/bin:/bin"},
  };
  for (const char* program : {"ruv", "guihelper.sh"}) {
    Install(program, "echo \"$LD_LIBRARY_PATH|$PATH\" >'" + Directory() + "/environment." + program + "'");
  }
  for (const Row& row : rows) {
    RunOptions options = Environment("LD_LIBRARY_PATH", row.library_path);
    options.environment["PATH"] = row.path;
    Run({}, options);
    const std::string expected = row.library_path_after + "|" + row.path + ":./mellanox\n";
    EXPECT_EQ(ReadFile(Directory() + "/environment.ruv"), expected);
    EXPECT_EQ(ReadFile(Directory() + "/environment.guihelper.sh"), expected);
  }
  // Without PATH the shells below find nothing by name: the application leaves its environment as the kernel shows it.
  Install("ruv", "/bin/cat /proc/self/environ >'" + Directory() + "/environment.ruv'");
  Run({}, Environment("PATH", std::nullopt));
  EXPECT_THAT(ReadFile(Directory() + "/environment.ruv"), HasSubstr(std::string("\0PATH=./mellanox\0", 17)));
}

TEST_F(RunSequence, AnInterruptedToolEndsTheRunAtOnce) {
  for (const char* option : {"--update", "-v"}) {
    SCOPED_TRACE(option);
    TearDown();
    SetUp();
    fs::create_directory(kRepository);
    // As Ctrl-C does it: the whole foreground process group gets the signal, here one of the launcher's own.
    Install("tavtool", "kill -INT 0; sleep 1");
    const RunResult run = Run({option}, Prelude("set -- setsid --wait \"$@\""));
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.out, ::testing::EndsWith("RUV application is determined by the user!\n"));
    EXPECT_THAT(Trace(), ::testing::EndsWith(" 2>&1\n"));
    EXPECT_THAT(CallsOf("tavtool"), SizeIs(1));
    EXPECT_THAT(CallsOf("ruv"), IsEmpty());
  }
}

TEST_F(RunSequence, WhatTheParentLeftOrTheConsoleDoesIsNoFailure) {
  fs::create_directory(kRepository);
  InstallTool({{"comparelocal", 30}});
  // SIGCHLD ignored: exit codes still arrive, here as a message.
  EXPECT_EQ(Run({}, Prelude("set -- env --ignore-signal=CHLD \"$@\"")).out,
            "You already have the latest version RUV.\n");
  // A console that nobody reads: the message is lost, the run is not, and the application dies of SIGPIPE as usual.
  Install("ruv", "kill -PIPE $$; echo ignored >'" + Directory() + "/survived'");
  EXPECT_EQ(Run({}, Prelude("mkfifo pipe; sleep 0.2 <pipe & exec >pipe; wait")).status, 0);
  EXPECT_EQ(ReadFile(Directory() + "/survived"), "");
  // A parent that ignores SIGPIPE wants that for all.
  Install("ruv", "sed -n 's/^SigIgn:.*\\(....\\)$/\\1/p' /proc/$$/status >'" + Directory() + "/ignored'");
  Run({}, Prelude("trap '' PIPE"));
  EXPECT_EQ(ReadFile(Directory() + "/ignored"), "1000\n");
  Run({});
  EXPECT_EQ(ReadFile(Directory() + "/ignored"), "0000\n");
  // Without standard output a file that is opened gets its descriptor. Then without any stream at all.
  Install("ruv");
  fs::remove(Directory() + "/calls.ruv");
  for (const char* closed : {"exec >&-", "exec <&- >&- 2>&-"}) EXPECT_EQ(Run({"-x"}, Prelude(closed)).status, 0);
  EXPECT_THAT(CallsOf("ruv"), ElementsAre("[-x]", "[-x]"));
  EXPECT_THAT(Trace(), Not(HasSubstr("You already have the latest version RUV.\n[TAVRUV]: You")));
}

TEST_F(RunSequence, AFileSizeLimitEndsNothing) { EXPECT_EQ(Run({}, Prelude("ulimit -f 0")).status, 0); }
