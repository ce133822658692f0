// ruv-trace's reports, also for concurrent runs and damaged traces.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <random>
#include <set>
#include <sstream>

#include "installation.h"

using nlohmann::json;
using ::testing::AllOf;
using ::testing::AnyOf;
using ::testing::Each;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::MatchesRegex;
using ::testing::Not;
using ::testing::SizeIs;
using ::testing::StartsWith;

namespace fs = std::filesystem;

namespace {

const std::string kHeader = "RUN VERDICT MACHINE DID    PACKAGE AND RUV, OR WHAT IS WRONG\n";

// Returns both outputs of ruv-trace and, unless it is 0, its exit status. The arguments are shell text.
std::string Report(const std::string& arguments = "") {
  setenv("RUV_TRACE", TestedProgram(RUV_TRACE_EXE, "bin/ruv-trace").c_str(), 1);
  std::string text;
  std::FILE* pipe = popen(("exec 2>&1; \"$RUV_TRACE\" " + arguments).c_str(), "r");
  for (int byte = 0; (byte = std::getc(pipe)) != EOF;) text.push_back(static_cast<char>(byte));
  const int status = pclose(pipe);
  return text + (status == 0 ? "" : "status " + std::to_string(status >> 8));
}

std::string ReportOf(const std::string& trace, const std::string& arguments = "") {
  WriteFile(kTraceFile, trace);
  return Report(arguments);
}

Strings Lines(const std::string& text) {
  std::istringstream stream(text);
  Strings lines;
  for (std::string line; std::getline(stream, line);) lines.push_back(line + "\n");
  return lines;
}

std::string Joined(const Strings& lines) {
  std::string text;
  for (const std::string& line : lines) text += line;
  return text;
}

std::vector<json> Runs(const std::string& arguments = "") {
  std::vector<json> runs;
  for (const std::string& line : Lines(Report("--json " + arguments))) runs.push_back(json::parse(line));
  return runs;
}

std::vector<json> RunsOf(const std::string& trace) {
  WriteFile(kTraceFile, trace);
  return Runs();
}

// Prepares a machine with a newer package in the repository.
void ProvidePackage(const Installation& machine, const std::string& copy_script = "echo copied") {
  machine.CreateRepository();
  machine.InstallTool({{"comparelocal", 21}}, "Version=2.31\n");
  machine.InstallCopyScript(copy_script);
}

// Returns the trace of one run with all its package steps.
std::string TraceOf(const Strings& arguments, bool portable) {
  const Installation machine;
  ProvidePackage(machine);
  fs::create_directories(machine.Directory() + "/media/update");
  machine.Run(arguments, Environment("ZEM_PORTABLE_EXEC_DIR", portable ? machine.Directory() + "/media" : ""));
  return ReadFile(kTraceFile);
}

// Together these runs pass through every step: import, check, download, installation and launch.
const std::vector<std::pair<Strings, bool>> kCompleteRuns = {
    {{"-b"}, true}, {{"--update"}, false}, {{"--ipmi-lan"}, false}};

}  // namespace

// Checks what is reported of a run. The package is that of the JSON output; the line is that of the listing without the
// run's number and machine, with single blanks.
void ExpectReport(const Strings& arguments, const std::map<std::string, int>& tool_codes, const std::string& package,
                  const std::string& line) {
  SCOPED_TRACE(line);
  const Installation machine;
  ProvidePackage(machine);
  machine.InstallTool(tool_codes, "Version=2.31\n");
  machine.Run(arguments);
  const json run = Runs().at(0);
  const std::string verdict = run.at("verdict");
  const std::string mode = run.at("mode");
  const std::string outcome = line.substr(verdict.size() + mode.size() + 2);
  EXPECT_EQ(verdict + " " + mode + " " + outcome, line);
  EXPECT_EQ(run.at("reason").is_null(), verdict == "ok");
  EXPECT_EQ(run.at("package"), package);
  std::string ruv = outcome.substr(outcome.find("; ruv ") + 6);
  std::replace(ruv.begin(), ruv.end(), ' ', '_');
  EXPECT_EQ(run.at("ruv"), outcome.find("; ruv ") == std::string::npos ? "not_started" : ruv);
  const std::string columns = "  1 " + (verdict + "       ").substr(0, 8) + "1234    " + (mode + "  ").substr(0, 7);
  EXPECT_THAT(Report(), StartsWith(kHeader + columns + outcome + "\n1 run: "));
}

TEST(RuvTrace, ReportsWhatARunDid) {
  const std::string same = "ok launch package: nothing newer; ruv started";
  const std::string installed = "ok launch 2.31: copy script ran; ruv started";
  const std::string nothing = "ok check package: nothing newer; ruv not started";
  ExpectReport({"-b"}, {}, "nothing_newer", same);
  ExpectReport({"-r", "x"}, {}, "nothing_newer", same);
  ExpectReport({}, {}, "nothing_newer", same + " or declined");
  ExpectReport({"-d", "b"}, {}, "nothing_newer", same + " or declined");
  ExpectReport({"-d", "-b"}, {}, "nothing_newer", same);
  ExpectReport({"x\n-b y"}, {}, "nothing_newer", same + " or declined");
  ExpectReport({"-d", "--show_stderr"}, {}, "nothing_newer",
               "problem launch option -d has no value; ruv started or declined");
  ExpectReport({"--vmware-esxi", "h"}, {}, "not_checked", "ok launch package: not checked; ruv started");
  ExpectReport({}, {{"comparelocal", 21}}, "copy_script_ran", installed);
  ExpectReport({}, {{"comparelocal", 21}, {"expand", 52}}, "copy_script_ran", installed);
  ExpectReport({"-b"}, {{"comparelocal", 52}}, "nothing_newer", same);
  ExpectReport({"--chkupd"}, {}, "available", "ok check package: available; ruv not started");
  ExpectReport({"--chkupd"}, {{"compareweb", 30}}, "nothing_newer", nothing);
  ExpectReport({"--chkupd"}, {{"compareweb", 33}}, "nothing_newer", nothing);
  ExpectReport({"--update"}, {{"compareweb", 40}}, "nothing_newer", nothing);
  ExpectReport({"--update"}, {}, "nothing_newer", "ok update package: nothing newer; ruv not started");
}

TEST(RuvTrace, ReportsFailedToolCalls) {
  struct Row {
    std::string argument;
    std::string verb;
    int exit_code;
    std::string package;
    std::string meaning;
  };
  for (const Row& row : std::initializer_list<Row>{
           {"-b", "expand", 60, "expansion_failed", "Error, package corrupted o...; ruv started"},
           {"-b", "comparelocal", 127, "check_failed", "tavtool not found, ...; ruv started"},
           {"-b", "comparelocal", 126, "check_failed", "tavtool cannot be e...; ruv started"},
           {"-b", "comparelocal", 137, "check_failed", "unknown exit code, ...; ruv started"},
           {"-b", "comparelocal", 128, "check_failed", "unknown exit code; ruv started"},
           {"--chkupd", "compareweb", 42, "check_failed", "Unable to connect to update website"},
           {"--chkupd", "compareweb", 21, "check_failed", "unexpected exit code; ruv not started"},
           {"--chkupd", "compareweb", 61, "check_failed", "unexpected exit code; ruv not started"},
           {"--update", "acquire", 31, "download_failed", "There's no update available for this s..."}}) {
    const std::string mode = row.argument == "-b" ? "launch" : row.argument == "--update" ? "update" : "check";
    const int comparelocal = row.verb == "comparelocal" ? row.exit_code : 21;
    ExpectReport({row.argument}, {{"comparelocal", comparelocal}, {row.verb, row.exit_code}}, row.package,
                 "problem " + mode + " " + row.verb + " " + std::to_string(row.exit_code) + ": " + row.meaning);
  }
}

TEST(RuvTrace, ReportsToolCalls) {
  const Installation machine;
  machine.Run({"--update", "--update_m", "5678"});
  const json run = Runs().at(0);
  const json& call = run.at("tool_calls").at(1);
  EXPECT_EQ(run.at("machine_type"), "5678");
  EXPECT_EQ(run.at("operating_system"), "rhel5");
  EXPECT_EQ(run.at("architecture"), "64");
  EXPECT_TRUE(run.at("command").is_null());
  EXPECT_EQ(call.at("verb"), "acquire");
  EXPECT_EQ(call.at("exit_code"), 0);
  EXPECT_EQ(call.at("result"), "ok");
  EXPECT_EQ(call.at("meaning"), "success");
  EXPECT_FALSE(call.at("command_cut"));
  EXPECT_THAT(call.at("command").get<std::string>(), EndsWith("--force --latest 2>/dev/null 1>/dev/null 2>&1"));
}

TEST(RuvTrace, SaysWhichCommandsMayBeCut) {
  const Installation machine;
  machine.Run({"-b"});
  const std::string begin = "[Status:]InvokeRUV: command = ";
  const std::size_t room = 511 - begin.size() - Runs().at(0).at("command").get<std::string>().size();
  for (const std::size_t longer : {room - 1, room, room + 1}) {
    machine.Run({"-b", std::string(longer - 3, 'x')});
    const json run = Runs().back();
    EXPECT_EQ(run.at("command_cut"), longer >= room);
    EXPECT_EQ(begin.size() + run.at("command").get<std::string>().size(), 511 - (longer < room ? 1U : 0U));
  }
  EXPECT_THAT(Report("--long"), EndsWith("2>/dev/nul...\n4 runs: 4 ok, 0 problem, 0 unknown\n"));
}

TEST(RuvTrace, PrintsAllThatARunSays) {
  const Installation machine;
  ProvidePackage(machine);
  fs::create_directories(machine.Directory() + "/media/update");
  machine.Run({"-b"}, Environment("ZEM_PORTABLE_EXEC_DIR", machine.Directory() + "/media"));
  EXPECT_EQ(machine.WithPlainDirectory(Report("--long")),
            kHeader +
                R"(  1 ok      1234    launch 2.31: copy script ran; ruv started
      line 1 of /var/log/ZEM_Support/ruvtav.log, machine 1234 rhel5/64
      copy 0: success
        "@/tavtool" copy -l "@/media/update" -t "/var/ZEM_Support" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1
      comparelocal 21: newer package
        "@/tavtool" comparelocal -l "/var/ZEM_Support" -s "@" -m 1234 -o rhel5 -a 64 1>tav.log 2>&1
      expand 0: success
        @/tavtool expand -l "/var/ZEM_Support" -t "/tmp/tav" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1
      command: "@/ruv" -b 2>/dev/null
1 run: 1 ok, 0 problem, 0 unknown
)");
  EXPECT_EQ(machine.WithPlainDirectory(Report("--json")),
            R"({"file":"/var/log/ZEM_Support/ruvtav.log","line":1,"run":1,"verdict":"ok","reason":null,)"
            R"("machine_type":"1234","operating_system":"rhel5","architecture":"64","mode":"launch",)"
            R"("package":"copy_script_ran","package_version":"2.31","ruv":"started",)"
            R"("command":"\"@/ruv\" -b 2>/dev/null","command_cut":false,"tool_calls":[)"
            R"({"verb":"copy","exit_code":0,"result":"ok","meaning":"success","command":"\"@/tavtool\" copy )"
            R"(-l \"@/media/update\" -t \"/var/ZEM_Support\" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1",)"
            R"("command_cut":false},{"verb":"comparelocal","exit_code":21,"result":"ok","meaning":"newer package",)"
            R"("command":"\"@/tavtool\" comparelocal -l \"/var/ZEM_Support\" -s \"@\" -m 1234 -o rhel5 -a 64 )"
            R"(1>tav.log 2>&1","command_cut":false},{"verb":"expand","exit_code":0,"result":"ok",)"
            R"("meaning":"success","command":"@/tavtool expand -l \"/var/ZEM_Support\" -t \"/tmp/tav\" -m 1234 )"
            R"(-o rhel5 -a 64 1>/dev/null 2>&1","command_cut":false}]})"
            "\n");
  const Strings lines = Lines(ReadFile(kTraceFile));
  EXPECT_EQ(ReportOf(Joined({lines.begin() + 1, lines.end()}), "--long"),
            kHeader +
                "  1 unknown ?       ?      its beginning is missing\n"
                "      line 1 of /var/log/ZEM_Support/ruvtav.log, machine ? ?/?\n"
                "      reason: its beginning is missing\n"
                "1 run: 0 ok, 0 problem, 1 unknown\n");
  EXPECT_EQ(ReportOf(lines[0] + Joined({lines.begin() + 2, lines.end()}), "--check"),
            "unknown: mixed with another run, or lines are missing (run 1)\nstatus 2");
}

TEST(RuvTrace, GivesTheMeaningOfExitCodes) {
  struct Row {
    std::string verb;
    int exit_code;
    std::string result;
    std::string meaning;
    std::string package;
  };
  const Row rows[] = {
      {"copy", 0, "ok", "success", "unknown"},
      {"copy", 1, "problem", "Invalid command parameter specified", "unknown"},
      {"copy", 30, "ok", "You already have the latest version RUV", "unknown"},
      {"comparelocal", 0, "ok", "nothing newer", "nothing_newer"},
      {"comparelocal", 21, "ok", "newer package", "available"},
      {"comparelocal", 61, "ok", "no payload", "nothing_newer"},
      {"comparelocal", -1, "problem", "the shell could not be started or waited for", "check_failed"},
      {"comparelocal", 126, "problem", "tavtool cannot be executed", "check_failed"},
      {"comparelocal", 127, "problem", "tavtool not found, or no shell could be started", "check_failed"},
      {"comparelocal", 128, "problem", "unknown exit code", "check_failed"},
      {"comparelocal", 129, "problem", "unknown exit code, or ended by a signal", "check_failed"},
      {"expand", 0, "ok", "success", "expanded"},
      {"expand", 52, "ok", "no payload", "expanded"},
      {"expand", 21, "problem", "unexpected exit code", "expansion_failed"},
      {"expand", 40, "problem", "There's no update available for this system on internet currently",
       "expansion_failed"},
      {"compareweb", 0, "ok", "update available", "available"},
      {"compareweb", 52, "problem", "unexpected exit code", "check_failed"},
      {"compareweb", 33, "ok", "There's no update available for this system on internet currently", "nothing_newer"},
      {"acquire", 32, "ok", "success", "downloaded"},
      {"acquire", 30, "problem", "You already have the latest version RUV", "download_failed"},
  };
  const std::string traces[] = {TraceOf({"-b"}, true), TraceOf({"--update"}, false)};
  const Installation machine;
  for (const Row& row : rows) {
    const std::string& trace = traces[row.verb == "compareweb" || row.verb == "acquire" ? 1 : 0];
    const std::string mark = "Return Code from tavtool = ";
    const std::size_t code = trace.find(mark, trace.find(" " + row.verb + " -l "));
    const json run = RunsOf(trace.substr(0, code + mark.size()) + std::to_string(row.exit_code) + "\n").at(0);
    const json& call = run.at("tool_calls").back();
    SCOPED_TRACE(call.dump());
    EXPECT_EQ(call.at("verb"), row.verb);
    EXPECT_EQ(call.at("exit_code"), row.exit_code);
    EXPECT_EQ(call.at("result"), row.result);
    EXPECT_EQ(call.at("meaning"), row.meaning);
    EXPECT_EQ(run.at("package"), row.package);
    EXPECT_EQ(run.at("verdict"), row.result == "ok" ? "unknown" : "problem");
  }
}

TEST(RuvTrace, ReportsCopyScripts) {
  const std::pair<std::string, std::string> rows[] = {
      {"printf x", "ok      1234    launch 2.31: copy script ran; ruv started\n"},
      {"exit 3", "ok      1234    launch 2.31: copy script ran; ruv started\n"},
      {"rm \"$0\"", "ok      1234    launch 2.31: copy script ran; ruv started\n"},
      {"printf '[TAVRUV]: [Status:]Return Code from tavtool = 9\\nno line feed'",
       "ok      1234    launch 2.31: copy script ran; ruv started\n"},
      {"echo \"sh: 1: $0: Permission denied\"; echo more",
       "ok      1234    launch 2.31: copy script ran; ruv started\n"},
  };
  for (const auto& [script, line] : rows) {
    const Installation machine;
    ProvidePackage(machine, script);
    machine.Run({"-b"});
    EXPECT_THAT(Report(), HasSubstr("  1 " + line)) << script;
  }
  const Installation machine;
  ProvidePackage(machine);
  WriteFile(std::string(kExpansionDirectory) + "/ruv/data/copy.sh", "#!/no/such/shell\n");
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  1 problem 1234    launch copy script not run: not found; ruv started\n"));
  EXPECT_EQ(Runs().at(0).at("package"), "copy_script_not_run");
  machine.InstallCopyScript();
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  2 ok      1234    launch 2.31: copy script ran; ruv started\n"));
  fs::remove_all(kExpansionDirectory);
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  3 problem 1234    launch the package has no copy script; ruv started\n"));
  EXPECT_EQ(Runs().at(2).at("package"), "no_copy_script");
}

TEST(RuvTrace, ReportsAPackageThatIsInstalledAgain) {
  const Installation machine;
  ProvidePackage(machine);
  machine.Run({"-b"});
  machine.InstallTool({{"compareweb", 31}, {"comparelocal", 21}}, "Version=2.31\n");
  machine.Run({"--chkupd"});  // says nothing about the installed package
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  3 problem 1234    launch 2.31 installed again: the last instal...; ruv started\n"
                                  "3 runs: 2 ok, 1 problem, 0 unknown\n"));
  machine.InstallTool({});
  machine.Run({"-b"});  // nothing newer: now it did take
  machine.InstallTool({{"comparelocal", 21}}, "Version=2.31\n");
  machine.Run({"-b"});
  EXPECT_EQ(Runs().back().at("verdict"), "ok");
}

TEST(RuvTrace, ReportsOkOnlyIfEveryLineIsInSequence) {
  for (const auto& [arguments, portable] : kCompleteRuns) {
    const Strings lines = Lines(TraceOf(arguments, portable));
    ASSERT_EQ(RunsOf(Joined(lines)).at(0).at("verdict"), "ok");
    for (std::size_t i = 0; i < lines.size(); ++i) {
      // Not in every run: a command that makes a directory. While the copy script runs, any line may be its own.
      if (lines[i].find("mkdir") != std::string::npos || lines[i] == "copied\n") continue;
      const bool copies = lines[i].find("CopyTAVToRUVFoler: command") != std::string::npos;
      SCOPED_TRACE(lines[i]);
      Strings cut(lines.begin(), lines.begin() + static_cast<std::ptrdiff_t>(i) + 1);
      Strings missing = lines;
      missing.erase(missing.begin() + static_cast<std::ptrdiff_t>(i));
      Strings twice = lines;
      twice.insert(twice.begin() + static_cast<std::ptrdiff_t>(i), lines[i]);
      Strings swapped = lines;
      std::swap(swapped[i], swapped[(i + 1) % lines.size()]);
      if (copies || i + 1 == lines.size()) twice = missing;  // the last line twice is another run's
      for (const Strings& trace : {cut, missing, twice, copies ? missing : swapped}) {
        if (trace == lines) continue;
        const std::vector<json> runs = RunsOf(Joined(trace));
        EXPECT_THAT(runs, SizeIs(::testing::Le(2U)));
        const json& last = runs.back();
        EXPECT_EQ(last.at("verdict"), "unknown");
        EXPECT_NE(last.at("ruv"), "not_started");
        EXPECT_TRUE(last.at("reason").is_string());
      }
    }
  }
}

TEST(RuvTrace, ReportsWhereAnUnfinishedRunStopped) {
  const std::pair<std::string, std::string> rows[] = {
      {"Entering TAVMaster::GetTAVBinaryPath", "?       ?      the launcher's directory was not found, or unfinished"},
      {"TAVMaster: command = ", "?       ?      unfinished: in guihelper.sh"},
      {"[Status:]MT = ", "1234    ?      unfinished: between two steps"},
      {"Entering TAVMaster::ParseParameters", "1234    ?      help shown, or unfinished"},
      {"Exiting TAVMaster::ParseParameters", "1234    ?      options rejected, or unfinished"},
      {"CompareTAVPackage: TAVToolCmd", "1234    launch unfinished: in tavtool"},
      {"CopyTAVToRUVFoler: command", "1234    launch unfinished: in the copy script"},
      {"InvokeRUV: command", "1234    launch unfinished: in ruv or at the question before it"},
  };
  const std::string trace = TraceOf({"-b"}, false);
  for (const auto& [line, expected] : rows) {
    const std::size_t end = trace.find('\n', trace.find(line)) + 1;
    const std::string cut = trace.substr(0, end);
    EXPECT_THAT(ReportOf(cut), StartsWith(kHeader + "  1 unknown " + expected)) << line;
    // The next run is whole, except where the one before may have gone on in its place.
    const std::string next = Lines(ReportOf(cut + trace)).at(2);
    const bool only_its_end_is_missing = line.find("InvokeRUV") == 0;
    EXPECT_THAT(next, StartsWith(only_its_end_is_missing ? "  2 problem 1234    launch 2.31 installed again"
                                 : line.find("Entering") == 0 || line.find("Exiting") == 0 ? "  2 ok "
                                                                                           : "  2 unknown "));
  }
  const Installation machine;
  machine.Run({"-h"});
  machine.Run({"--update_m", "1"});
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("3 runs: 1 ok, 0 problem, 2 unknown\n"));
  fs::remove(kSystemInformationFile);
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  4 problem unknown launch machine unknown: no system information; ruv started\n"));
}

// Checks runs whose tavtool exits with N if given the argument -cN. All launch-mode runs start ruv.
void ExpectNothingFalse(const std::vector<json>& runs) {
  for (const json& run : runs) {
    SCOPED_TRACE(run.dump());
    if (run.at("command").is_string()) {
      EXPECT_EQ(run.at("mode"), "launch");
      EXPECT_THAT(run.at("ruv"), AnyOf("started", "unknown"));
    }
    for (const json& call : run.at("tool_calls")) {
      const std::string command = call.at("command");
      const std::size_t code = command.find(" -c");
      if (call.at("exit_code").is_null()) continue;
      EXPECT_EQ(call.at("exit_code"), code == std::string::npos ? 0 : std::stoi(command.substr(code + 3)));
    }
  }
}

void InstallToolWithCodes(const Installation& machine) {
  machine.CreateRepository();
  machine.Install("tavtool",
                  "for word; do case $word in -c*) sleep 0.0${word#-c}; exit ${word#-c} ;; esac; done\n"
                  "[ $1 != comparelocal ] || sleep 0.02");
}

TEST(RuvTrace, LeavesOtherRunsAloneWhileTheApplicationRuns) {
  const Installation machine;
  machine.Run({"--chkupd"});
  const std::string check = ReadFile(kTraceFile);
  const std::string help = check.substr(0, check.find("[TAVRUV]: [Debug:] Exiting TAVMaster::ParseParameters"));
  const std::string launch = TraceOf({"-b"}, false);
  const std::size_t end = launch.find("[TAVRUV]: [Debug:] Exiting TAVMaster::InvokeRUV");
  std::string trace = launch.substr(0, end) + help;
  for (int i = 0; i < 25; ++i) trace += check;
  EXPECT_THAT(ReportOf(trace + launch.substr(end) + check), EndsWith("\n28 runs: 26 ok, 0 problem, 2 unknown\n"));
  const std::size_t middle = check.find("[TAVRUV]: [Debug:] Entering TAVMaster::CheckUpdate");
  EXPECT_THAT(ReportOf(launch.substr(0, end) + check.substr(0, middle) + launch.substr(end) + check.substr(middle)),
              EndsWith("\n2 runs: 1 ok, 0 problem, 1 unknown\n"));
  // Killed runs: each is as certain as the first.
  const std::string cut = launch.substr(0, launch.find('\n', launch.find("CompareTAVPackage: TAVToolCmd")) + 1);
  EXPECT_THAT(ReportOf(cut + cut + check + check),
              AllOf(HasSubstr("  2 unknown 1234    launch unfinished: in tavtool\n"),
                    EndsWith("\n4 runs: 2 ok, 0 problem, 2 unknown\n")));
  EXPECT_THAT(Report("--long"), HasSubstr("      reason: unfinished: in tavtool\n      comparelocal: no exit code\n"));
  // After so many whole runs, a killed one is taken for dead.
  std::string later = launch.substr(0, launch.find('\n', launch.find("DecompressTAV: TAVToolCmd")) + 1);
  EXPECT_THAT(ReportOf(later + launch), HasSubstr("  2 unknown 1234    launch unfinished run 1 may have gone on"));
  for (int i = 0; i < 25; ++i) later += check;
  EXPECT_THAT(ReportOf(later + launch), EndsWith("\n27 runs: 26 ok, 0 problem, 1 unknown\n"));
}

TEST(RuvTrace, ClaimsNothingFalseAboutConcurrentRuns) {
  const Installation machine;
  InstallToolWithCodes(machine);
  std::string all;
  for (int i = 0; i < 30; ++i) {
    const std::string number = std::to_string(i);
    all += "sleep 0.02; \"$0\" -b -n" + number + " & \"$0\" --update -c" + number + " & ";
  }
  machine.Run({"-b", "-n99"}, Prelude("{ " + all + "wait; } >/dev/null"));
  const std::vector<json> runs = Runs();
  ASSERT_THAT(runs, SizeIs(61));
  ExpectNothingFalse(runs);
  EXPECT_TRUE(std::any_of(runs.begin(), runs.end(), [](const json& run) { return run.at("verdict") == "unknown"; }));
  EXPECT_EQ(runs.back().at("verdict"), "ok");
}

TEST(RuvTrace, ClaimsNothingFalseAboutInterleavedTraces) {
  const Installation machine;
  InstallToolWithCodes(machine);
  std::vector<Strings> traces;
  for (const Strings& arguments :
       {Strings{"-b"}, {"--update", "-c1"}, {"-r"}, {"--chkupd", "-c42"}, {"--update", "-c31"}, {"-b", "x"}}) {
    fs::remove(kTraceFile);
    machine.Run(arguments);
    traces.push_back(Lines(ReadFile(kTraceFile)));
  }
  std::set<std::string> verdicts;
  for (unsigned seed = 400; seed < 520; ++seed) {
    SCOPED_TRACE(seed);
    std::mt19937 random(seed);
    const auto one_in = [&random](unsigned count) { return random() % count == 0; };
    std::vector<Strings> running;  // the lines that each of them still writes
    std::string trace;
    for (int begun = 0; begun < 40 || !running.empty();) {
      if (begun < 40 && (running.empty() || one_in(3 + seed % 6))) {
        running.push_back(traces[random() % traces.size()]);
        ++begun;
      }
      Strings& lines = running[random() % running.size()];
      // A launcher writes many lines at once, and then waits for a program.
      bool waits = false;
      while (!waits && !lines.empty()) {
        waits = lines.front().find("ommand = ") != std::string::npos ||
                lines.front().find("Cmd = ") != std::string::npos || one_in(50);
        trace += lines.front();
        lines.erase(lines.begin());
      }
      if (seed % 3 == 0 && one_in(30)) lines.clear();  // killed
      running.erase(std::remove_if(running.begin(), running.end(), [](const Strings& left) { return left.empty(); }),
                    running.end());
    }
    const std::vector<json> runs = RunsOf(trace);
    ExpectNothingFalse(runs);
    for (const json& run : runs) verdicts.insert(run.at("verdict").get<std::string>());
  }
  EXPECT_THAT(verdicts, SizeIs(3));
}

TEST(RuvTrace, HidesPasswords) {
  const Installation machine;
  machine.Run({"--chkupd", "--proxy-user=me", "--Proxy-Password=secret", "-v"});
  for (const Strings& arguments :
       {Strings{"-t", "me:secret@host/a@b"}, Strings{"-t", "me:secret secret@host", "-v"},
        Strings{"--ipmi-lan", "me:secret@10.0.0.1:8"}, Strings{"--VMWARE-ESXI", "me:se:cret@h"},
        Strings{"--remote-zfld", "me:secret -secret@h"}, Strings{"--ipmi-lan", "-t", "me:x -secret@h"},
        Strings{"--ipmi-lan=me:secret@h"}, Strings{"-t", "a@b:secret"}, Strings{"-t", "me:secret"},
        Strings{"-t", "me:x\n-secret@h"}, Strings{"--proxy-password=x 2>secret -x"},
        Strings{"--proxy-password=secret secret", "-v"},
        Strings{std::string(440, '-'), "--proxy-password=secretsecretsecretsecret"}}) {
    machine.Run(arguments);
  }
  for (const char* option : {"", "--long", "--json", "--check", "--check --json"}) {
    EXPECT_THAT(Report(option), Not(AnyOf(HasSubstr("secret"), HasSubstr("se:cret")))) << option;
  }
  for (const char* option : {"--long", "--json"})
    EXPECT_THAT(Report(option + std::string(" --show-passwords")), HasSubstr("secret"));
  EXPECT_THAT(Report("--long"),
              AllOf(HasSubstr("--proxy-user=me --Proxy-Password=*** 2>/dev/null"),
                    HasSubstr("-t \"me:***@b\" 2>/dev/null"), HasSubstr("--ipmi-lan \"me:***@10.0.0.1:8\""),
                    HasSubstr("--remote-zfld me:***@h 2>/dev/null"), HasSubstr("--vmware-esxi \"me:***@h\"")));
}

TEST(RuvTrace, ShowsTextButNoControlCharacters) {
  const Installation machine;
  WriteFile(kSystemInformationFile, "ZEM_SYSTEM_MT=\xc3\xa4\xe2\x82\xac\x1b\xff\n");
  machine.Run({"-b", "\xc3\xb6\x07\xc2\x9b\xe2\x80\xae\\\"\x7f\n\xfe"});
  EXPECT_THAT(Report(), HasSubstr("  1 ok      \xc3\xa4\xe2\x82\xac\\u... launch"));
  EXPECT_THAT(Report("--long"), HasSubstr("\"\xc3\xb6\\u0007\\u009b\\u202e\\\"\\u007f\\n\xef\xbf\xbd\" 2>/dev/null\n"));
  EXPECT_THAT(Report("--json"), Not(::testing::ContainsRegex("[\x7f-\xff]")));
  machine.CreateRepository();
  machine.InstallTool({{"comparelocal", 21}}, "Version=2\x1b[3m\n");
  machine.InstallCopyScript();
  EXPECT_EQ(machine.Run({"-b"}).status, 0);
  EXPECT_THAT(Report(), HasSubstr("launch 2\\u001b[3: copy script ran; ruv started\n"));
  machine.InstallTool({});
  // What moves or hides text is escaped, what is next to it in Unicode is not.
  const std::string shown = "\xc2\xa0\xe2\x80\x8a\xe2\x80\x90\xe2\x80\xa7\xe2\x80\xaf\xe2\x81\xa5\xe2\x81\xaa";
  machine.Run({"-b", shown + "\xd8\x9c\xe2\x80\x8b\xe2\x80\x8f\xe2\x80\xa8\xe2\x81\xa6\xe2\x81\xa9"});
  EXPECT_THAT(Report("--long"), HasSubstr(shown + "\\u061c\\u200b\\u200f\\u2028\\u2066\\u2069\" 2>/dev/null\n"));
  EXPECT_EQ(Runs().at(0).at("machine_type"), "\xc3\xa4\xe2\x82\xac\x1b\xef\xbf\xbd");
}

TEST(RuvTrace, SurvivesDamage) {
  std::string trace;
  for (const auto& [arguments, portable] : kCompleteRuns) trace += TraceOf(arguments, portable);
  for (unsigned seed = 1; seed <= 60; ++seed) {
    SCOPED_TRACE(seed);
    std::mt19937 random(seed);
    const auto below = [&](std::size_t limit) { return static_cast<std::size_t>(random()) % limit; };
    std::string damaged = trace;
    for (int i = 0; i < 5; ++i) {
      damaged[below(damaged.size())] = static_cast<char>(below(256));
      damaged.erase(below(damaged.size()), below(60));
      damaged.insert(below(damaged.size()), damaged.substr(below(damaged.size()), below(400)));
    }
    for (const json& run : RunsOf(damaged)) EXPECT_THAT(run.at("verdict"), AnyOf("ok", "problem", "unknown"));
    for (const std::string& line : Lines(Report() + Report("--long"))) {
      EXPECT_THAT(line, Not(::testing::ContainsRegex("[\x01-\x09\x0b-\x1f\x7f]")));
      const bool detail = line.substr(0, 6) == "      ";
      EXPECT_TRUE(detail || line.size() <= 80U + 1) << line;
    }
  }
}

TEST(RuvTrace, JudgesTheLastRun) {
  const Installation machine;
  const std::string ok = TraceOf({"-b"}, false);
  const std::string cut = ok.substr(0, ok.rfind("[TAVRUV]"));
  EXPECT_EQ(ReportOf(ok, "--check"), "ok: 2.31: copy script ran; ruv started (run 1)\n");
  EXPECT_EQ(ReportOf(ok + ok, "--check"),
            "problem: 2.31 installed again: the last installation did not take; "
            "ruv started (run 2)\nstatus 1");
  EXPECT_THAT(ReportOf(cut, "--check"),
              AllOf(StartsWith("unknown: unfinished: between two steps"), EndsWith("status 2")));
  EXPECT_EQ(ReportOf("[TAVRUV]: text\n", "--check"),
            std::string("ruv-trace: no run of the launcher in ") + kTraceFile + "\nstatus 3");
  EXPECT_EQ(ReportOf(ok + ok, "--problems"),
            kHeader +
                "  2 problem 1234    launch 2.31 installed again: the last instal...; ruv started\n"
                "2 runs: 1 ok, 1 problem, 0 unknown\n");
  EXPECT_THAT(ReportOf(ok, "--problems"), EndsWith("1 run: 1 ok, 0 problem, 0 unknown\n"));
}

TEST(RuvTrace, ReadsFilesInTheOrderGivenAndRefusesOthers) {
  const Installation machine;
  const std::string trace = TraceOf({"-b"}, false);
  const std::string half = trace.substr(0, trace.find("[TAVRUV]: [Debug:] Entering TAVMaster::InvokeRUV"));
  const std::string old_file = machine.Directory() + "/old";
  const std::string both = old_file + " " + machine.Directory() + "/new";
  WriteFile(old_file, half);
  WriteFile(machine.Directory() + "/new", trace.substr(half.size()));
  EXPECT_THAT(Report(both), EndsWith("\n1 run: 1 ok, 0 problem, 0 unknown\n"));
  EXPECT_THAT(Report("- <" + old_file), EndsWith("\n1 run: 0 ok, 0 problem, 1 unknown\n"));
  EXPECT_EQ(Runs(both).at(0).at("file"), old_file);
  EXPECT_EQ(ReportOf("x\n" + trace, "--check --json | grep -c '\"line\":2,'"), "1\n");
  WriteFile(machine.Directory() + "/new", "");
  EXPECT_THAT(Report(both), EndsWith("\n1 run: 0 ok, 0 problem, 1 unknown\n"));
  EXPECT_THAT(Report("--check " + machine.Directory() + "/new"), AllOf(HasSubstr("no run of"), EndsWith("status 3")));
  std::system(("gzip " + old_file).c_str());
  EXPECT_THAT(Report(old_file + ".gz"), AllOf(HasSubstr("/old.gz is compressed: use zcat"), EndsWith("status 1")));
  EXPECT_THAT(Report("/etc/passwd"), AllOf(HasSubstr("no run of the launcher in /etc/passwd"), EndsWith("status 1")));
  EXPECT_THAT(Report("/tmp/none"), EndsWith("cannot read /tmp/none: No such file or directory\nstatus 1"));
  EXPECT_THAT(Report("/tmp"), EndsWith("cannot read /tmp: Is a directory\nstatus 1"));
  EXPECT_THAT(ReportOf(trace, ">/dev/full"), EndsWith("cannot write: No space left on device\nstatus 1"));
  // A line longer than every buffer hides nothing after it.
  EXPECT_THAT(ReportOf(std::string(3'000'000, 'x') + "\n" + trace), EndsWith("\n1 run: 1 ok, 0 problem, 0 unknown\n"));
}

TEST(RuvTrace, PrintsHelpVersionAndUsageErrors) {
  const std::string help = Report("--help");
  EXPECT_EQ(help, Report("-h"));
  EXPECT_THAT(help, StartsWith("Usage: ruv-trace [OPTION]... [FILE]...\n"));
  EXPECT_THAT(Lines(help), AllOf(SizeIs(::testing::Le(16U)), Each(SizeIs(::testing::Le(81U)))));
  EXPECT_THAT(Report("--version"), MatchesRegex("ruv-trace [0-9]+\\.[0-9]+\\.[0-9]+\n"));
  EXPECT_THAT(Report("--help >/dev/full"), EndsWith("status 1"));
  EXPECT_THAT(Report("--no-such-option"), EndsWith("Try ruv-trace --help.\nstatus 64"));
}
