// The application's command line, and the question on an unsupported machine.
#include "installation.h"

namespace {

const std::string kWarning =
    "You might need to download an update for RUV to support this system.\n"
    "Use the -? or -h parameter for more information about downloading updates.\n";
const std::string kQuestion = "Do you want to proceed anyway (function may be limited)? (Y/N)";

std::string Repeated(int count, const std::string& text) { return count == 0 ? "" : text + Repeated(count - 1, text); }

}  // namespace

TEST(ApplicationLaunch, QuotesTheValuesOfSpecialParameters) {
  struct Row {
    Strings arguments;
    std::string command;  // after the application's path
    std::string traced;   // the messages about special parameters
  };
  const auto processing = [](const std::string& option) {
    return "[TAVRUV]: [Debug:] Processing special parameters [" + option + "]\n";
  };
  const std::string missing = "[TAVRUV]: [Error:]InvokeRUV: required parameters are missing for option = -d\n";
  const Row rows[] = {
      {{"-v", "-i", "/tmp/data.xml"}, " -v -i \"\"/tmp/data.xml\"\" 2>/dev/null", processing("-i")},
      {{"-i", "/tmp/my-data.xml", "--show_stderr"}, " -i \"/tmp/my-data.xml\"", processing("-i")},
      {{"-html", "--x", "-d", "a b"},
       " -html \"--x\" -d \"\"a b\"\" 2>/dev/null",
       processing("-html") + processing("-d")},
      {{"-d", "--show_stderr"}, " -d", processing("-d") + missing},
      {{"-r"}, " -r \"2>/dev/null\"", processing("-r")},
      {{"-d", "-r", "-r"}, " -d \"-r\" -r \"2>/dev/null\"", processing("-d") + processing("-r")},
      {{"-D", "-ihtml", "-htm"}, " -D -ihtml -htm 2>/dev/null", ""},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(PrintToString(row.arguments));
    const Installation machine;
    machine.Run(row.arguments);
    EXPECT_THAT(machine.Trace(), HasSubstr("TAVMaster::InvokeRUV()\n" + row.traced +
                                           "[TAVRUV]: [Status:]InvokeRUV: command = \"@/ruv\"" + row.command + "\n"));
    EXPECT_THAT(machine.CallsOf("ruv"), SizeIs(1));
  }
}

TEST(ApplicationLaunch, AsksUntilTheAnswerIsYOrN) {
  struct Row {
    std::string input;
    int questions;
    Strings started;
  };
  const Row rows[] = {
      {"y\n", 1, {"[-v]"}},
      {"Y\n", 1, {"[-v]"}},
      {"n\ny\n", 1, {}},
      {"yes\nno\n y\n\nYy\ny \nN\n", 7, {}},
      {"maybe\ny", 2, {"[-v]"}},  // a last line without a line feed
      {"", 1, {}},                // the end of the input
      {"what\n", 2, {}},
      {std::string("y\0\ny\r\n", 6), 3, {}},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.input);
    const Installation machine;
    machine.MakeUnsupported();
    const RunResult run = machine.Run({"-v"}, Input(row.input));
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, kWarning + Repeated(row.questions, kQuestion) + (row.started.empty() ? "Exit RUV\n" : ""));
    EXPECT_EQ(machine.CallsOf("ruv"), row.started);
    EXPECT_THAT(machine.Trace(), HasSubstr("[Status:]InvokeRUV: command = \"@/ruv\" -v 2>/dev/null\n"
                                           "[TAVRUV]: [Debug:] Exiting TAVMaster::InvokeRUV()\n"));
  }
}

// The terminal is non-blocking, as another program may leave it. Each Ctrl-D (\004) ends a read, the second one empty.
TEST(ApplicationLaunch, WaitsForTheAnswerAndAsksAgainAfterCtrlD) {
  const Installation machine;
  machine.MakeUnsupported();
  EXPECT_EQ(machine.Run({}, Typed("maybe\004\004y\n")).out, kWarning + kQuestion + kQuestion);
  EXPECT_THAT(machine.CallsOf("ruv"), ElementsAre(""));
}

TEST(ApplicationLaunch, TakesAnUnreadableAnswerAsNo) {
  const Installation machine;
  machine.MakeUnsupported();
  for (const char* input : {"exec </", "exec <&-"}) {
    EXPECT_EQ(machine.Run({}, Prelude(input)).out, kWarning + kQuestion + "Exit RUV\n") << input;
  }
  EXPECT_THAT(machine.CallsOf("ruv"), IsEmpty());
}

TEST(ApplicationLaunch, LeavesTheInputAfterTheAnswerToTheApplication) {
  const Installation machine;
  machine.MakeUnsupported();
  machine.Install("ruv", "cat");
  EXPECT_EQ(machine.Run({}, Input("y\nfor the application\n")).out, kWarning + kQuestion + "for the application\n");
  EXPECT_EQ(machine.Run({}, Prelude("mkfifo pipe; printf 'y\\nthrough a pipe\\n' >pipe & exec <pipe")).out,
            kWarning + kQuestion + "through a pipe\n");
}

TEST(ApplicationLaunch, WarnsOnlyIfTheMachineTypeMatters) {
  const std::pair<Strings, std::string> rows[] = {
      {{"-b"}, kWarning},       {{"-r", "file"}, ""},
      {{"-i", "5555.xml"}, ""}, {{"--vmware-esxi", "host"}, ""},
      {{"--ipmi-lan"}, ""},     {{"-v"}, kWarning + kQuestion + "Exit RUV\n"},
  };
  const Installation machine;
  machine.MakeUnsupported();
  for (const auto& [arguments, out] : rows) EXPECT_EQ(machine.Run(arguments).out, out) << PrintToString(arguments);
}

TEST(ApplicationLaunch, TracesALongCommandInPartAndRunsItWhole) {
  const Installation machine;
  EXPECT_EQ(machine.Run(Strings(3000, "-argument")).status, 0);
  EXPECT_EQ(machine.CallsOf("ruv").at(0).size(), 3000 * std::string("[-argument]").size());
  EXPECT_LE(machine.TraceLines("[Status:]InvokeRUV: command = ").at(0).size(), 511U);
}
