// What the launcher takes out of the shared command line, and what it passes on and how.
#include "launcher_fixture.h"

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::SizeIs;

class Options : public LauncherTest {
 protected:
  // The command that the last launch ran, without the application's path.
  std::string LaunchCommand() const {
    const Strings commands = TraceLines("[Status:]InvokeRUV: command = \"@/ruv\"");
    return commands.empty() ? "none" : commands.back();
  }
};

TEST_F(Options, ForwardedArguments) {
  struct Row {
    Strings arguments;
    std::string command;   // behind the application's path
    std::string received;  // by the application
    Strings unknown;       // options that the trace warns about
  };
  const Row rows[] = {
      {{}, " 2>/dev/null", "", {}},
      {{"--show_stderr"}, "", "", {}},
      {{"-v", "abc", "a-b", "-B", "-I", "-H"},
       " -v \"abc\" a-b -B -I -H 2>/dev/null",
       "[-v][abc][a-b][-B][-I][-H]",
       {}},
      {{"", "two words"}, " \"\" \"two words\" 2>/dev/null", "[][two words]", {}},
      {{"--IPMI-LAN", "u:p@10.0.0.1"}, " --ipmi-lan \"u:p@10.0.0.1\" 2>/dev/null", "[--ipmi-lan][u:p@10.0.0.1]", {}},
      {{"--vmware-ESXI"}, " --vmware-esxi 2>/dev/null", "[--vmware-esxi]", {}},
      {{"--help", "--", "--Proxy-Port=80"},
       " --help -- --Proxy-Port=80 2>/dev/null",
       "[--help][--][--Proxy-Port=80]",
       {"--help", "--", "--proxy-port=80"}},
      {{"--GUI", "--cmd", "--Show_StdErr", "-x"}, " -x", "[-x]", {}},
      {{"-b", "-r", "file", "-q"}, " -b -r \"\"file\"\" -q 2>/dev/null", "[-b][-r][file][-q]", {}},
      {{"--updat", "--update_x", "-update"},
       " --updat --update_x -update 2>/dev/null",
       "[--updat][--update_x][-update]",
       {"--updat", "--update_x"}},
      {{"--\xc3\x84", "%s%n"}, " --\xc3\x84 \"%s%n\" 2>/dev/null", "[--\xc3\x84][%s%n]", {"--\xc3\x84"}},
  };
  const std::string warning = "[Status:]Warning: Unknown Parameter \"";
  const std::string warning_end = "\" to RUV TAV, and it will be transfered to tavtool or RUV application.";
  for (const Row& row : rows) {
    SCOPED_TRACE(::testing::PrintToString(row.arguments));
    TearDown();
    SetUp();
    EXPECT_EQ(Run(row.arguments).out, "");
    EXPECT_EQ(LaunchCommand(), row.command);
    EXPECT_THAT(CallsOf("ruv"), ElementsAre(row.received));
    Strings expected;
    for (const std::string& option : row.unknown) expected.push_back(option + warning_end);
    EXPECT_EQ(TraceLines(warning), expected);
  }
}

TEST_F(Options, StandardErrorIsTheUsersOnlyOnRequest) {
  Install("ruv", "echo trouble >&2");
  EXPECT_EQ(Run({}).out, "");
  EXPECT_EQ(Run({"--SHOW_stderr"}).out, "trouble\n");
}

TEST_F(Options, IdentityForThePackageTool) {
  struct Row {
    Strings arguments;
    std::string tool_call;
  };
  const std::string check = "[compareweb][-l][@]";
  const Row rows[] = {
      {{"--update_m", "5678", "--chkupd", "--update_os", "sles11", "--Update_Arch", "32"},
       check + "[-m][5678][-o][sles11][-a][32][--latest]"},
      {{"--chkupd", "--update_m", "-h"}, check + "[-m][-h][-o][rhel5][-a][64][--latest]"},
      {{"--chkupd", "--update_os"}, check + "[-m][1234][-o][rhel5][-a][64][--latest]"},
      {{"--chkupd", "--update_os", "a b"}, check + "[-m][1234][-o][a][b][-a][64][--latest]"},
      {{"--chkupd", "-i", "/a-b/9876xyz.xml", "proxy"},
       check + "[-m][9876][-o][rhel5][-a][64][--latest][-i][/a-b/9876xyz.xml][proxy]"},
      {{"--chkupd", "-i", "dir/ab"}, check + "[-m][ab][-o][rhel5][-a][64][--latest][-i][dir/ab]"},
      {{"--chkupd", "-i", "-555.xml"}, check + "[-m][-555][-o][rhel5][-a][64][--latest][-i][-555.xml]"},
      {{"--chkupd", "-i", "dir/"}, check + "[-m][-o][rhel5][-a][64][--latest][-i][dir/]"},
      {{"--chkupd", "-i"}, check + "[-m][1234][-o][rhel5][-a][64][--latest][-i]"},
      {{"--chkupd", "--update_m", "5678", "-i", "4321"}, check + "[-m][4321][-o][rhel5][-a][64][--latest][-i][4321]"},
      {{"--chkupd", "-i", "4321", "--update_m", "5678"}, check + "[-m][5678][-o][rhel5][-a][64][--latest][-i][4321]"},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(::testing::PrintToString(row.arguments));
    TearDown();
    SetUp();
    EXPECT_EQ(Run(row.arguments).status, 0);
    EXPECT_THAT(CallsOf("tavtool"), ElementsAre(row.tool_call));
  }
}

TEST_F(Options, RejectedCombinations) {
  const std::string together = "ERROR: You can not specify --chkupd and --update together\n";
  const std::string target =
      "Error: You should specify [--update_m]/[--update_os]/[--update_arch] with [--chkupd] or [--update]\n";
  const std::pair<Strings, std::string> rows[] = {
      {{"--chkupd", "--unknown", "--UPDATE"}, together},
      {{"--update_m", "1", "--update", "--chkupd"}, together},
      {{"--update_m", "--update"}, target},
      {{"-v", "--update_os"}, target},
      {{"--update_arch", "32", "-b"}, target},
  };
  for (const auto& [arguments, message] : rows) {
    SCOPED_TRACE(::testing::PrintToString(arguments));
    TearDown();
    SetUp();
    const RunResult run = Run(arguments);
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, message);
    EXPECT_THAT(Trace(), ::testing::EndsWith("[Debug:] Exiting TAVMaster::ParseParameters()\n"));
    EXPECT_THAT(CallsOf("tavtool"), IsEmpty());
    EXPECT_THAT(CallsOf("ruv"), IsEmpty());
  }
}

TEST_F(Options, HelpWinsOverEverythingButAValue) {
  const std::string usage = Run({"-h"}).out;
  // An option begins in column 1; a description begins in column 10, also behind a short option.
  std::istringstream lines(usage);
  std::size_t number = 0;
  for (std::string line; std::getline(lines, line);) {
    ++number;
    EXPECT_THAT(line, ::testing::MatchesRegex("|Syntax:.*|Options:|Note:.*|(-[^ ]+)( [<[].*)?| {9}[^ ].*[^ ]|"
                                              " {12}\\[vmware3.5\\]\\[vmware4.0\\]|-.{8}[A-Z].*|-upload  \\[.*"))
        << "line " << number;
  }
  EXPECT_EQ(number, 96U);
  EXPECT_THAT(usage, ::testing::StartsWith("Syntax:  RUV_Executable_Program [options]\n\nOptions:\n\n-b       Run"));
  EXPECT_THAT(usage, ::testing::EndsWith("\n\nNote: All options must be separated with one or more spaces.\n"));
  EXPECT_THAT(usage, HasSubstr("system at:\n         https://"));
  EXPECT_THAT(Trace(), ::testing::EndsWith("[Debug:] Entering TAVMaster::ParseParameters()\n"));

  for (const Strings& arguments :
       {Strings{"-?"}, Strings{"--chkupd", "--update", "-?"}, Strings{"--update_m", "1", "-h"}}) {
    const RunResult run = Run(arguments);
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, usage);
  }
  EXPECT_THAT(CallsOf("ruv"), IsEmpty());
  Run({"-H", "--help", "-html", "-h"});
  EXPECT_THAT(CallsOf("ruv"), SizeIs(0));  // "-h" is help also behind "-html"
}
