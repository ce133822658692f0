// The application's command line, and the question on a machine that the application does not know.
#include "launcher_fixture.h"

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;

class ApplicationLaunch : public LauncherTest {
 protected:
  static constexpr const char* kWarning =
      "You might need to download an update for RUV to support this system.\n"
      "Use the -? or -h parameter for more information about downloading updates.\n";
  static constexpr const char* kQuestion = "Do you want to proceed anyway (function may be limited)? (Y/N)";

  void MakeUnsupported() { WriteFile(Directory() + "/data/supportlist.xml", "<MT>9999</MT>\n"); }
};

TEST_F(ApplicationLaunch, SpecialParametersQuoteTheirValue) {
  struct Row {
    Strings arguments;
    std::string command;
    Strings processed;
    Strings missing;
  };
  const Row rows[] = {
      {{"-v", "-i", "/tmp/data.xml"}, " -v -i \"\"/tmp/data.xml\"\" 2>/dev/null", {"-i]"}, {}},
      {{"-i", "/tmp/my-data.xml", "--show_stderr"}, " -i \"/tmp/my-data.xml\"", {"-i]"}, {}},
      {{"-html", "--x", "-d", "a b"}, " -html \"--x\" -d \"\"a b\"\" 2>/dev/null", {"-html]", "-d]"}, {}},
      {{"-d", "--show_stderr"}, " -d", {"-d]"}, {"-d"}},
      {{"-r"}, " -r \"2>/dev/null\"", {"-r]"}, {}},
      {{"-d", "-r", "-r"}, " -d \"-r\" -r \"2>/dev/null\"", {"-d]", "-r]"}, {}},
      {{"-D", "-ihtml", "-htm"}, " -D -ihtml -htm 2>/dev/null", {}, {}},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(::testing::PrintToString(row.arguments));
    TearDown();
    SetUp();
    EXPECT_EQ(Run(row.arguments).status, 0);
    EXPECT_THAT(TraceLines("[Status:]InvokeRUV: command = "), ElementsAre("\"@/ruv\"" + row.command));
    EXPECT_EQ(TraceLines("[Debug:] Processing special parameters ["), row.processed);
    EXPECT_EQ(TraceLines("[Error:]InvokeRUV: required parameters are missing for option = "), row.missing);
    EXPECT_THAT(CallsOf("ruv"), ::testing::SizeIs(1));
  }
}

TEST_F(ApplicationLaunch, TheQuestionTakesOnlyYAndN) {
  struct Row {
    std::string input;
    int questions;
    bool started;
  };
  const Row rows[] = {
      {"y\n", 1, true},      {"Y\n", 1, true},
      {"n\ny\n", 1, false},  {"yes\nno\n y\n\nYy\ny \nN\n", 7, false},
      {"maybe\ny", 2, true},  // a last line without a line feed
      {"", 1, false},         // the end of the input
      {"what\n", 2, false},  {std::string("y\0\ny\r\n", 6), 3, false},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.input);
    TearDown();
    SetUp();
    MakeUnsupported();
    std::string expected = kWarning;
    for (int i = 0; i < row.questions; ++i) expected += kQuestion;
    if (!row.started) expected += "Exit RUV\n";
    const RunResult run = Run({"-v"}, Input(row.input));
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, expected);
    EXPECT_EQ(CallsOf("ruv"), row.started ? Strings{"[-v]"} : Strings{});
    EXPECT_THAT(Trace(), HasSubstr("[Status:]InvokeRUV: command = \"@/ruv\" -v 2>/dev/null\n"
                                   "[TAVRUV]: [Debug:] Exiting TAVMaster::InvokeRUV()\n"));
  }
}

TEST_F(ApplicationLaunch, AnUnreadableAnswerIsNo) {
  MakeUnsupported();
  for (const char* input : {"exec </", "exec <&-"}) {
    EXPECT_EQ(Run({}, Prelude(input)).out, std::string(kWarning) + kQuestion + "Exit RUV\n") << input;
  }
  EXPECT_THAT(CallsOf("ruv"), IsEmpty());
}

TEST_F(ApplicationLaunch, WhatStandsBehindTheAnswerIsTheApplications) {
  MakeUnsupported();
  Install("ruv", "cat");
  EXPECT_EQ(Run({}, Input("y\nfor the application\n")).out,
            std::string(kWarning) + kQuestion + "for the application\n");
  EXPECT_EQ(Run({}, Prelude("mkfifo pipe; printf 'y\\nthrough a pipe\\n' >pipe & exec <pipe")).out,
            std::string(kWarning) + kQuestion + "through a pipe\n");
}

TEST_F(ApplicationLaunch, WhenTheWarningIsDue) {
  struct Row {
    Strings arguments;
    std::string out;
  };
  const Row rows[] = {
      {{"-b"}, kWarning},
      {{"-r", "file"}, ""},
      {{"-i", "5555.xml"}, ""},
      {{"-i", "9999.xml"}, ""},
      {{"--vmware-esxi", "host"}, ""},
      {{"--ipmi-lan"}, ""},
      {{"-v"}, std::string(kWarning) + kQuestion + "Exit RUV\n"},
  };
  MakeUnsupported();
  for (const Row& row : rows) EXPECT_EQ(Run(row.arguments).out, row.out) << ::testing::PrintToString(row.arguments);
  // The list may hold the empty machine type, and then an empty one is supported.
  WriteFile(Directory() + "/data/supportlist.xml", "<MT>");
  WriteFile(kSystemInformationFile, "ZEM_SYSTEM_MT=\n");
  EXPECT_EQ(Run({}).out, "");
}

TEST_F(ApplicationLaunch, ALongCommandIsTracedInPartAndRunWhole) {
  const Strings arguments(3000, "-argument");
  EXPECT_EQ(Run(arguments).status, 0);
  EXPECT_EQ(CallsOf("ruv").at(0).size(), 3000 * std::string("[-argument]").size());
  EXPECT_LE(TraceLines("[Status:]InvokeRUV: command = ").at(0).size(), 511U);
}
