// What ruv-trace says of runs of the launcher, and that no trace, however damaged, makes it fail or tell a lie.
#include <cstdio>
#include <filesystem>
#include <random>
#include <regex>
#include <sstream>

#include "installation.h"

using ::testing::AllOf;
using ::testing::AnyOf;
using ::testing::HasSubstr;
using ::testing::Not;

namespace fs = std::filesystem;

class RuvTrace : public ::testing::Test, protected Installation {
 protected:
  using Installation::Run;  // not the test's own

  // What ruv-trace prints on both outputs, and its exit status where that is not 0.
  std::string Report(const std::string& arguments = "") const {
    std::string text;
    std::FILE* pipe = popen((RUV_TRACE_EXE " 2>&1 " + arguments).c_str(), "r");
    for (int byte = 0; (byte = std::getc(pipe)) != EOF;) text.push_back(static_cast<char>(byte));
    const int status = pclose(pipe);
    return WithPlainDirectory(text) + (status == 0 ? "" : "status " + std::to_string(status >> 8));
  }
  std::string ReportOf(const std::string& trace, const std::string& arguments = "") const {
    WriteFile(kTraceFile, trace);
    return Report(arguments);
  }
  // The trace of two runs, of which the first installs a package.
  std::string TwoRuns() {
    fs::create_directories(kRepository);
    InstallTool({{"comparelocal", 21}}, "Version=2.31\n");
    InstallCopyScript("echo copied");
    Run({"-v", "-b"});
    Run({"--chkupd"});
    return Trace();
  }
};

TEST_F(RuvTrace, TellsHowARunWent) {
  struct Row {
    Strings arguments;
    std::map<std::string, int> tool;  // its exit codes
    std::string report;               // behind what all rows share
    std::string program = "ruv";      // that does
    std::string then = "exit 3";
  };
  const std::string kill = "kill -KILL 0; sleep 9";
  const std::string look_alike =
      "echo '[TAVRUV]: [Status:]Return Code from tavtool = 9\n[TAVRUV]: [Debug:] Entering TAVMaster::InvokeRUV()\n"
      "[TAVRUV]: [Status:]InvokeRUV: command = x'; printf 'no line feed'; exit 1";
  const std::string expanded =
      "launch  comparelocal=21 (newer package), expand=0 (success)  package 2.31: copy script ";
  const std::string ran = expanded + "ran  completed  ruv started: \"@/ruv\" 2>/dev/null";
  const std::string corrupted =
      "launch  comparelocal=21 (newer package), expand=60 (Error, package corrupted or not enough free space on disk.) "
      " "
      "package: not installed: expansion failed  completed  ruv started or declined: \"@/ruv\" 2>/dev/null";
  const std::string same = "launch  comparelocal=0 (nothing newer)  ";
  const std::string started = same + "completed  ruv started: \"@/ruv\" ";
  const std::string either = same + "completed  ruv started or declined: \"@/ruv\" ";
  const std::string never = "  completed  ruv not started";
  const Row rows[] = {
      {{}, {{"comparelocal", 21}}, ran, "copy.sh"},
      {{}, {{"comparelocal", 21}}, ran, "copy.sh", look_alike},
      {{},
       {{"comparelocal", 21}},
       expanded + "unfinished  unfinished in the copy script  ruv not started",
       "copy.sh",
       kill},
      {{}, {{"comparelocal", 21}, {"expand", 60}}, corrupted},
      {{"-b"}, {}, started + "-b 2>/dev/null"},
      {{"-d", "-r"}, {}, started + "-d \"-r\" 2>/dev/null"},
      {{"-d", "b", "-bx"}, {}, either + "-d \"\"b\"\" -bx 2>/dev/null"},
      {{"--ipmi-lan"}, {}, "launch  completed  ruv started: \"@/ruv\" --ipmi-lan 2>/dev/null"},
      {{"a\nb\x1b[1m\xff\xc2\x9b", "--show_stderr"}, {}, either + "\"a\\x0ab\\x1b[1m\\xff\\xc2\\x9b\""},
      {{std::string(600, 'v')}, {}, either + "\"" + std::string(473 - Directory().size(), 'v') + "..."},
      {{}, {}, same + "unfinished in ruv or the question before it  ruv unknown: \"@/ruv\" 2>/dev/null", "ruv", kill},
      {{}, {}, "launch  comparelocal=? (no exit code)  unfinished in the comparison  ruv not started", "tavtool", kill},
      {{"--chkupd"}, {}, "check  compareweb=0 (update available)" + never},
      {{"--update"}, {{"compareweb", 127}}, "check or update  compareweb=127 (tavtool not found)" + never},
      {{"--update"}, {{"acquire", 99}}, "update  compareweb=0 (update available), acquire=99 (unknown code)" + never},
      {{"--chkupd", "--update"}, {}, "options rejected, or cut short  ruv not started"},
      {{"-h"}, {}, "help shown, or cut short  ruv not started"},
  };
  fs::create_directories(kRepository);
  for (const Row& row : rows) {
    fs::remove(kTraceFile);
    Install("ruv");
    InstallTool(row.tool, "Version=2.31\n");
    InstallCopyScript(row.then);
    if (row.program != "copy.sh") Install(row.program, row.then);
    Run(row.arguments);
    EXPECT_EQ(Report(), "run 1, line 1  MT 1234 rhel5/64  " + row.report + "\n") << row.program << ": " << row.then;
  }
}

TEST_F(RuvTrace, TellsRunsAtTheSameTimeApart) {
  Run({"-v"});
  const std::string run = Trace();
  const std::string other = std::regex_replace(run, std::regex("-v"), "-x");
  const std::size_t waiting = run.find('\n', run.find("InvokeRUV: command")) + 1;
  const auto line = [](const std::string& what) { return HasSubstr("  " + what + " 2>/dev/null\n"); };
  const std::string mixed = "completed  mixed with another run  ruv started or declined: \"@/ruv\" ";
  EXPECT_THAT(ReportOf(run.substr(0, waiting) + other + run.substr(waiting)),
              AllOf(line(mixed + "-v"), line(mixed + "-x")));
  // A run that was cut short casts no doubt on the next.
  EXPECT_THAT(ReportOf(run.substr(0, waiting) + other),
              AllOf(line("ruv unknown: \"@/ruv\" -v"), Not(HasSubstr("mixed"))));
}

// A full disk leaves out lines. Then the report is as without the loss, or says that something is not known.
TEST_F(RuvTrace, ALostLineMakesNoLie) {
  const std::string trace = TwoRuns();
  const std::string report = ReportOf(trace);
  for (std::size_t at = 0; at < trace.size(); at = trace.find('\n', at) + 1) {
    const std::size_t length = trace.find('\n', at) - at;
    EXPECT_THAT(ReportOf(std::string(trace).erase(at, length)),
                AnyOf(report, HasSubstr("lines missing"), HasSubstr("unfinished")))
        << trace.substr(at, length);
  }
}

TEST_F(RuvTrace, DamageMakesNoInvalidJson) {
  const std::string trace = TwoRuns() + Trace();
  const std::regex object(R"re(\{([-\]\[{}:,0-9a-z]|"([^"\\[:cntrl:]]|\\["\\u])*")*\})re");
  std::mt19937 random(1);
  for (int round = 0; round < 100; ++round) {
    std::string damaged = trace;
    for (int change = 0; change < 40; ++change) {
      const std::size_t at = random() % damaged.size();
      if (change % 2 == 0) damaged[at] = static_cast<char>(random());
      if (change % 3 == 0) damaged.erase(at, random() % 90 + 1);
      if (change % 5 == 0) damaged.insert(at, trace, random() % trace.size(), 300);
    }
    const std::string report = ReportOf(damaged, "--json");
    EXPECT_EQ(Report("--json | iconv -f UTF-8 -t UTF-8"), report);
    std::istringstream lines(report);
    for (std::string line; std::getline(lines, line);) EXPECT_TRUE(std::regex_match(line, object)) << line;
  }
}

TEST_F(RuvTrace, FilesAndOptions) {
  const std::string trace = TwoRuns();
  const std::string report = Report();
  EXPECT_EQ(ReportOf(std::string(300000, 'x') + trace), report) << "a line that does not end hides the next";
  EXPECT_EQ(Report("- <" + std::string(kTraceFile)), report);
  EXPECT_THAT(
      Report("/none /tmp " + std::string(kTraceFile)),
      AllOf(HasSubstr("read /none: "), HasSubstr("read /tmp: "), HasSubstr(": run 2, "), HasSubstr("\nstatus 1")));
  EXPECT_EQ(system(("gzip -k " + std::string(kTraceFile)).c_str()), 0);
  EXPECT_THAT(Report(kTraceFile + std::string(".gz")), AllOf(HasSubstr("is compressed"), HasSubstr("status 1")));
  EXPECT_THAT(Report("--jason"), HasSubstr("status 2"));
  EXPECT_THAT(Report(">/dev/full"), HasSubstr("status 1"));
}
