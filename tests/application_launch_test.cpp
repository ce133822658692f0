// The application's command line, and the question on an unsupported machine.
#include "installation.h"

namespace {

const std::string kWarning =
    "You might need to download an update for RUV to support this system.\n"
    "Use the -? or -h parameter for more information about downloading updates.\n";
const std::string kQuestion = "Do you want to proceed anyway (function may be limited)? (Y/N)";

std::string Repeated(int count, const std::string& text) { return count == 0 ? "" : text + Repeated(count - 1, text); }

// A prelude that gives the launcher this input, a printf format.
std::string Input(const std::string& text) { return "printf '" + text + "' >input; exec <input"; }

}  // namespace

TEST(ApplicationLaunch, QuotesTheValuesOfSpecialParameters) {
  const std::pair<Strings, std::string> rows[] = {
      {{"-v", "-i", "/tmp/data.xml"}, " -v -i \"\"/tmp/data.xml\"\" 2>/dev/null"},
      {{"-i", "/tmp/my-data.xml", "--show_stderr"}, " -i \"/tmp/my-data.xml\""},
      {{"-html", "--x", "-d", "a b"}, " -html \"--x\" -d \"\"a b\"\" 2>/dev/null"},
      {{"-d", "--show_stderr"}, " -d"},
      {{"-r"}, " -r \"2>/dev/null\""},
      {{"-d", "-r", "-r"}, " -d \"-r\" -r \"2>/dev/null\""},
      {{"-D", "-ihtml", "-htm"}, " -D -ihtml -htm 2>/dev/null"},
  };
  const Installation machine;
  for (const auto& [arguments, command] : rows) {
    machine.Run(arguments);
    EXPECT_EQ(machine.LastTraceLine("[Status:]InvokeRUV: command = "), "\"@/ruv\"" + command);
  }
  EXPECT_THAT(machine.CallsOf("ruv"), SizeIs(std::size(rows)));
  EXPECT_THAT(machine.TraceLines("[Debug:] Processing special parameters "),
              ElementsAre("[-i]", "[-i]", "[-html]", "[-d]", "[-d]", "[-r]", "[-d]", "[-r]"));
  EXPECT_THAT(machine.TraceLines("[Error:]"),
              ElementsAre("InvokeRUV: required parameters are missing for option = -d"));
}

TEST(ApplicationLaunch, AsksUntilTheAnswerIsYOrN) {
  const std::tuple<std::string, int, Strings> rows[] = {
      {"y\n", 1, {"[-v]"}},      {"Y\n", 1, {"[-v]"}}, {"n\ny\n", 1, {}}, {"yes\nno\n y\n\nYy\ny \nN\n", 7, {}},
      {"maybe\ny", 2, {"[-v]"}},  // a last line without a line feed
      {"what\n", 2, {}},          // the end of the input
      {"y\\0\ny\r\n", 3, {}},
  };
  for (const auto& [input, questions, started] : rows) {
    SCOPED_TRACE(input);
    const Installation machine;
    machine.MakeUnsupported();
    const RunResult run = machine.Run({"-v"}, Input(input));
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out, kWarning + Repeated(questions, kQuestion) + (started.empty() ? "Exit RUV\n" : ""));
    EXPECT_EQ(machine.CallsOf("ruv"), started);
    EXPECT_THAT(machine.Trace(), HasSubstr("[Status:]InvokeRUV: command = \"@/ruv\" -v 2>/dev/null\n"
                                           "[TAVRUV]: [Debug:] Exiting TAVMaster::InvokeRUV()\n"));
  }
}

// Another program, here dd, may leave the terminal non-blocking. Each Ctrl-D (\004) ends a read, the second one empty.
TEST(ApplicationLaunch, WaitsForTheAnswerAndAsksAgainAfterCtrlD) {
  const Installation machine;
  machine.MakeUnsupported();
  const std::string prelude =
      "exec 3>&1; (sleep 0.5; printf 'maybe\\004\\004y\\n') |"
      " script -qc \"dd iflag=nonblock count=0 status=none; $launcher >&3 2>&3\" /dev/null >/dev/null; exit";
  EXPECT_EQ(machine.Run({}, prelude).out, kWarning + kQuestion + kQuestion);
  EXPECT_THAT(machine.CallsOf("ruv"), ElementsAre(""));
}

TEST(ApplicationLaunch, TakesAnUnreadableAnswerAsNo) {
  const Installation machine;
  machine.MakeUnsupported();
  for (const char* input : {"exec </", "exec <&-"}) {
    EXPECT_EQ(machine.Run({}, input).out, kWarning + kQuestion + "Exit RUV\n") << input;
  }
  EXPECT_THAT(machine.CallsOf("ruv"), IsEmpty());
}

TEST(ApplicationLaunch, LeavesTheInputAfterTheAnswerToTheApplication) {
  const Installation machine;
  machine.MakeUnsupported();
  machine.Install("ruv", "cat");
  EXPECT_EQ(machine.Run({}, Input("y\nfor the application\n")).out, kWarning + kQuestion + "for the application\n");
  EXPECT_EQ(machine.Run({}, "mkfifo pipe; printf 'y\\nthrough a pipe\\n' >pipe & exec <pipe").out,
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
