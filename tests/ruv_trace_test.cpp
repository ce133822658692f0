// ruv-trace's reports, also of concurrent runs and damaged traces.
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
using namespace testing;

namespace {

const std::string kHeader = "RUN VERDICT MACHINE DID    PACKAGE AND RUV, OR WHAT IS WRONG\n";

// Returns both outputs of ruv-trace and, unless it is 0, its exit status. The arguments are shell text.
std::string Report(const std::string& arguments = "", const std::string& with = "") {
  setenv("RUV_TRACE", TestedProgram(RUV_TRACE_EXE, "bin/ruv-trace").c_str(), 1);
  std::string text;
  std::FILE* pipe = popen(("exec 2>&1; " + with + " \"$RUV_TRACE\" " + arguments).c_str(), "r");
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

std::string Joined(const Strings& lines, std::size_t begin = 0, std::size_t end = -1) {
  std::string text;
  for (std::size_t i = begin; i < std::min(end, lines.size()); ++i) text += lines[i];
  return text;
}

std::vector<json> Runs() {
  std::vector<json> runs;
  for (const std::string& line : Lines(Report("--json"))) runs.push_back(json::parse(line));
  return runs;
}

// Returns the listing of the last run, without its number, with single blanks.
std::string LastRun(const std::string& trace) {
  const Strings lines = Lines(ReportOf(trace));
  std::string listed;
  for (const char byte : lines.size() < 3 ? "" : lines[lines.size() - 2].substr(4)) {
    if (byte != '\n' && (byte != ' ' || listed.back() != ' ')) listed += byte;
  }
  return listed;
}

// A machine with a newer package in the repository and packages on a portable medium.
struct Machine : Installation {
  explicit Machine(std::map<std::string, int> tool_codes = {}, const std::string& copy_script = "echo copied") {
    CreateRepository();
    tool_codes.emplace("comparelocal", 21);
    InstallTool(tool_codes, "Version=2.31\n");
    InstallCopyScript(copy_script);
    std::filesystem::create_directories(Directory() + "/media/update");
  }
  RunResult RunPortable(const Strings& arguments, const std::string& medium = "media") const {
    return Run(arguments, ::Environment("ZEM_PORTABLE_EXEC_DIR", Directory() + "/" + medium));
  }
};

std::string TraceOf(const Strings& arguments, const std::map<std::string, int>& tool_codes = {}) {
  const Machine machine(tool_codes);
  machine.Run(arguments);
  return ReadFile(kTraceFile);
}

// Returns the trace up to and with the line that contains the text.
std::string UpTo(const std::string& text, const std::string& trace) {
  return trace.substr(0, trace.find('\n', trace.find(text)) + 1);
}

// The state of a run after each line: the one of the first row whose text the line contains.
const std::pair<const char*, const char*> kStates[] = {
    {"Entering TAVMaster::GetTAVBinaryPath", "unknown the launcher's directory was not found, or unfinished"},
    {"TAVMaster: command = ", "unknown unfinished: in guihelper.sh"},
    {"Entering TAVMaster::ParseParameters", "none help shown"},
    {"Unknown Parameter", "none help shown"},
    {"Exiting TAVMaster::ParseParameters", "none options rejected"},
    {"TAVToolCmd", "unknown unfinished: in tavtool"},
    {"CopyTAVToRUVFoler: command", "unknown unfinished: in the copy script"},
    {"copied", "unknown unfinished: in the copy script"},
    {"InvokeRUV: command", "unknown unfinished: in ruv or at the question before it"},
    {"", "unknown unfinished: between two steps"},
};

}  // namespace

TEST(RuvTrace, FollowsTheLauncherStepByStep) {
  const std::vector<std::pair<Strings, std::string>> runs = {
      {{"-b", "--one", "--two", "-d", "x"}, "media"},
      {{"-b"}, "nowhere"},
      {{"--update"}, "media"},
      {{"--update"}, ""},
      {{"--chkupd"}, ""},
      {{"--ipmi-lan"}, ""},
  };
  for (const auto& [arguments, medium] : runs) {
    const Machine machine;
    if (medium.empty())
      machine.Run(arguments);
    else
      machine.RunPortable(arguments, medium);
    const Strings lines = Lines(ReadFile(kTraceFile));
    EXPECT_THAT(LastRun(Joined(lines)), StartsWith("ok 1234 "));
    for (std::size_t i = 0; i + 1 < lines.size(); ++i) {
      SCOPED_TRACE(lines[i]);
      const auto* state = kStates;
      while (lines[i].find(state->first) == std::string::npos) ++state;
      ReportOf(Joined(lines, 0, i + 1));
      const json run = Runs().at(0);
      EXPECT_EQ(run.at("verdict").get<std::string>() + " " + run.at("reason").get<std::string>(), state->second);
      // Not in every run: these lines. While the copy script runs, any line may be its own.
      const auto is = [&](const char* text) { return lines[i].find(text) != std::string::npos; };
      if (is("mkdir") || is("copied") || is("special parameters") || is("Unknown Parameter")) continue;
      const std::string before = Joined(lines, 0, i), after = Joined(lines, i + 1);
      EXPECT_THAT(LastRun(before + after), StartsWith("unknown "));
      if (i == 0 || i + 5 > lines.size() || is("CopyTAVToRUVFoler: command")) continue;  // the last ones say nothing
      EXPECT_THAT(LastRun(before + lines[i] + lines[i] + after), StartsWith("unknown "));
      const std::string swapped = before + lines[i + 1] + lines[i] + Joined(lines, i + 2);
      EXPECT_THAT(LastRun(swapped), StartsWith(lines[i] == lines[i + 1] ? "ok " : "unknown "));
    }
  }
}

TEST(RuvTrace, ReportsWhatARunDid) {
  struct Row {
    Strings arguments;
    std::map<std::string, int> tool_codes;
    std::string package, line;
  };
  const std::string same = "ok 1234 launch package: nothing newer; ruv started";
  const std::string installed = "ok 1234 launch 2.31: copy script ran; ruv started";
  const std::map<std::string, int> none = {{"comparelocal", 0}};
  for (const Row& row : std::initializer_list<Row>{
           {{"-b"}, none, "nothing_newer", same},
           {{"-r", "x"}, none, "nothing_newer", same},
           {{"-i", "/d/1234.xml"}, none, "nothing_newer", same},
           {{}, none, "nothing_newer", same + " or declined"},
           {{"-d", "-b"}, none, "nothing_newer", same + " or declined"},
           {{"-d", "x -b y"}, none, "nothing_newer", same + " or declined"},
           {{"-x", std::string(450, 'x'), "-b"}, none, "nothing_newer", same + " or declined"},
           {{"-d", "--show_stderr"},
            none,
            "nothing_newer",
            "problem 1234 launch option -d has no value; ruv started or declined"},
           {{"--vmware-esxi", "h"}, {}, "not_checked", "ok 1234 launch package: not checked; ruv started"},
           {{}, {}, "copy_script_ran", installed},
           {{}, {{"expand", 52}}, "copy_script_ran", installed},
           {{"-b"}, {{"comparelocal", 52}}, "nothing_newer", same},
           {{"--chkupd"}, {}, "available", "ok 1234 check package: available; ruv not started"},
           {{"--update"},
            {{"compareweb", 40}},
            "nothing_newer",
            "ok 1234 check package: nothing newer; ruv not started"},
           {{"--update"}, none, "nothing_newer", "ok 1234 update package: nothing newer; ruv not started"},
           {{"--update", "--update_m", "5678"},
            {},
            "copy_script_ran",
            "ok 5678 update 2.31: copy script ran; ruv not started"},
           {{"-b"},
            {{"expand", 60}},
            "expansion_failed",
            "problem 1234 launch expand 60: Error, package corrupted o...; ruv started"},
           {{"-b"},
            {{"comparelocal", 127}},
            "check_failed",
            "problem 1234 launch comparelocal 127: tavtool not found, ...; ruv started"},
           {{"--chkupd"},
            {{"compareweb", 42}},
            "check_failed",
            "problem 1234 check compareweb 42: Unable to connect to update website"},
           {{"--chkupd"},
            {{"compareweb", 61}},
            "check_failed",
            "problem 1234 check compareweb 61: unexpected exit code; ruv not started"},
           {{"--update"},
            {{"acquire", 31}},
            "download_failed",
            "problem 1234 update acquire 31: There's no update available for this s..."},
           {{"-h"}, {}, "unknown", "none 1234 ? help shown"},
           {{"--update_m", "1"}, {}, "unknown", "none 1234 ? options rejected"}}) {
    SCOPED_TRACE(row.line);
    const std::string trace = TraceOf(row.arguments, row.tool_codes);
    EXPECT_EQ(LastRun(trace), row.line);
    EXPECT_EQ(Runs().at(0).at("package"), row.package);
    EXPECT_THAT(Report(), EndsWith("\n1 run: " + std::to_string(row.line[0] == 'o') + " ok, " +
                                   std::to_string(row.line[0] == 'p') + " problem, 0 unknown, " +
                                   std::to_string(row.line[0] == 'n') + " none\n"));
  }
  const Machine machine;
  std::filesystem::remove(kSystemInformationFile);
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  1 problem unknown launch machine unknown: no system information; ruv started\n"));
}

TEST(RuvTrace, GivesTheMeaningOfExitCodes) {
  struct Row {
    std::string verb;
    int exit_code;
    std::string result, meaning, package;
  };
  const std::string no_update = "There's no update available for this system on internet currently";
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
      {"expand", 40, "problem", no_update, "expansion_failed"},
      {"compareweb", 0, "ok", "update available", "available"},
      {"compareweb", 30, "ok", "You already have the latest version RUV", "nothing_newer"},
      {"compareweb", 31, "ok", no_update, "nothing_newer"},
      {"compareweb", 33, "ok", no_update, "nothing_newer"},
      {"compareweb", 52, "problem", "unexpected exit code", "check_failed"},
      {"acquire", 32, "ok", "success", "downloaded"},
      {"acquire", 30, "problem", "You already have the latest version RUV", "download_failed"},
  };
  const Machine machine;
  machine.Run({"--update"});
  machine.RunPortable({"-b"});
  const std::string trace = ReadFile(kTraceFile);
  const std::size_t second = trace.rfind("[TAVRUV]: [Debug:] Enter:");
  const std::string traces[] = {trace.substr(0, second), trace.substr(second)};
  for (const Row& row : rows) {
    const std::string& one = traces[row.verb == "compareweb" || row.verb == "acquire" ? 0 : 1];
    const std::string begin = one.substr(0, one.find('=', one.find("Return Code", one.find(" " + row.verb + " -l "))));
    ReportOf(begin + "= " + std::to_string(row.exit_code) + "\n");
    const json run = Runs().at(0), call = run.at("tool_calls").back();
    SCOPED_TRACE(call.dump());
    EXPECT_EQ(call.at("verb"), row.verb);
    EXPECT_EQ(call.at("exit_code"), row.exit_code);
    EXPECT_EQ(call.at("result"), row.result);
    EXPECT_EQ(call.at("meaning"), row.meaning);
    EXPECT_EQ(run.at("package"), row.package);
    EXPECT_EQ(run.at("verdict"), row.result == "ok" ? "unknown" : "problem");
  }
}

TEST(RuvTrace, ReportsInstallations) {
  const std::string ran = "ok 1234 launch 2.31: copy script ran; ruv started";
  for (const char* script : {"printf x", "exit 3", "rm \"$0\"", "echo sh: \"$0\"; echo \"x $0: y\"",
                             "printf '[TAVRUV]: [Status:]Return Code from tavtool = 9\\n[TAVRUV]: x\\nno line feed'"}) {
    const Machine machine({}, script);
    machine.Run({"-b"});
    EXPECT_EQ(LastRun(ReadFile(kTraceFile)), ran) << script;
  }
  const Machine machine;
  const auto run_it = [&](const Strings& arguments = {"-b"}) {
    WriteFile(kTraceFile, ReadFile(kTraceFile));
    machine.Run(arguments);
    return LastRun(ReadFile(kTraceFile));
  };
  const std::string script = std::string(kExpansionDirectory) + "/ruv/data/copy.sh";
  WriteFile(script, "#!/no/such/shell\n");
  EXPECT_EQ(run_it(), "problem 1234 launch copy script not run: not found; ruv started");
  EXPECT_EQ(Runs().back().at("package"), "copy_script_not_run");
  machine.InstallCopyScript();
  EXPECT_EQ(run_it(), ran);
  EXPECT_EQ(run_it({"--update", "--update_m", "5678"}), "ok 5678 update 2.31: copy script ran; ruv not started");
  EXPECT_EQ(run_it(), ran);
  machine.InstallTool({{"compareweb", 31}, {"comparelocal", 21}}, "Version=2.31\n");
  EXPECT_THAT(run_it({"--chkupd"}), StartsWith("ok "));  // says nothing about the installed package
  EXPECT_EQ(run_it(), "problem 1234 launch 2.31 installed again, or a version th...; ruv started");
  machine.InstallTool({});
  EXPECT_THAT(run_it(), StartsWith("ok 1234 launch package: nothing newer"));  // now it did take
  machine.InstallTool({{"comparelocal", 21}}, "Version=2.31\n");
  EXPECT_EQ(run_it(), ran);
  std::filesystem::remove(script);
  EXPECT_EQ(run_it(), "problem 1234 launch the package has no copy script; ruv started");
  EXPECT_EQ(Runs().back().at("package"), "no_copy_script");
  // The output of another program, and a command with a line feed.
  machine.Install("ruv", std::string("echo background >>") + kTraceFile);
  run_it({"-b", "--show_stderr"});
  EXPECT_EQ(machine.WithPlainDirectory(Runs().back().at("command")), "\"@/ruv\" -b");
  EXPECT_TRUE(Runs().back().at("command_cut"));
  run_it({"-b", "x\ny"});
  EXPECT_EQ(machine.WithPlainDirectory(Runs().back().at("command")), "\"@/ruv\" -b \"x\ny\" 2>/dev/null");
  EXPECT_FALSE(Runs().back().at("command_cut"));
}

TEST(RuvTrace, SaysWhichCommandsMayBeCut) {
  const Installation machine;
  machine.Run({"-b"});
  const std::size_t room =
      511 - std::string("[Status:]InvokeRUV: command = ").size() - Runs().at(0).at("command").get<std::string>().size();
  for (const std::size_t longer : {room - 1, room, room + 1}) {
    machine.Run({"-b", std::string(longer - 3, 'x')});
    const json run = Runs().back();
    EXPECT_EQ(run.at("command_cut"), longer >= room);
    EXPECT_EQ(run.at("command").get<std::string>().size(),
              Runs().at(0).at("command").get<std::string>().size() + std::min(longer, room));
  }
  EXPECT_THAT(Report("--long"), EndsWith("2>/dev/nul...\n4 runs: 4 ok, 0 problem, 0 unknown, 0 none\n"));
}

TEST(RuvTrace, PrintsEveryField) {
  const Machine machine;
  machine.RunPortable({"-b"});
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
1 run: 1 ok, 0 problem, 0 unknown, 0 none
)");
  const std::string trace = ReadFile(kTraceFile);
  ReportOf(UpTo("CompareTAVPackage: TAVToolCmd", trace));
  EXPECT_EQ(machine.WithPlainDirectory(Report("--json")),
            R"({"file":"/var/log/ZEM_Support/ruvtav.log","line":1,"run":1,"verdict":"unknown",)"
            R"("reason":"unfinished: in tavtool","machine_type":"1234","operating_system":"rhel5",)"
            R"("architecture":"64","mode":"launch","package":"unknown","package_version":null,"ruv":"unknown",)"
            R"("command":null,"command_cut":false,"tool_calls":[)"
            R"({"verb":"copy","exit_code":0,"result":"ok","meaning":"success","command":"\"@/tavtool\" copy )"
            R"(-l \"@/media/update\" -t \"/var/ZEM_Support\" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1",)"
            R"("command_cut":false},{"verb":"comparelocal","exit_code":null,"result":"unknown",)"
            R"("meaning":"no exit code","command":"\"@/tavtool\" comparelocal -l \"/var/ZEM_Support\" -s \"@\" )"
            R"(-m 1234 -o rhel5 -a 64 1>tav.log 2>&1","command_cut":false}]})"
            "\n");
  EXPECT_THAT(Report("--long"), HasSubstr("64\n      reason: unfinished: in tavtool\n      copy 0: success\n"));
  EXPECT_THAT(Report("--long"), HasSubstr("\n      comparelocal: no exit code\n"));
  EXPECT_EQ(ReportOf(Joined(Lines(trace), 1), "--long"),
            kHeader +
                "  1 unknown ?       ?      its beginning is missing\n"
                "      line 1 of /var/log/ZEM_Support/ruvtav.log, machine ? ?/?\n"
                "      reason: its beginning is missing\n"
                "1 run: 0 ok, 0 problem, 1 unknown, 0 none\n");
}

// Checks what is said of concurrent runs: the totals, and the reason of the first.
TEST(RuvTrace, FollowsConcurrentRuns) {
  const std::string launch = TraceOf({"-b"}), check = TraceOf({"--chkupd"}), help = TraceOf({"-h"});
  const std::string in_ruv = UpTo("InvokeRUV: command", launch), after_ruv = launch.substr(in_ruv.size());
  const std::string in_tool = UpTo("CompareTAVPackage: TAVToolCmd", launch), after_tool = launch.substr(in_tool.size());
  const std::string in_script = UpTo("CopyTAVToRUVFoler: command", launch);
  const std::string after_script = launch.substr(in_script.size());
  const std::string complaint = "sh: 1: /tmp/tav/ruv/data/copy.sh: Permission denied\n";
  const std::string failed = TraceOf({"--chkupd"}, {{"compareweb", 42}});
  const std::string in_check = UpTo("TAVToolCmd", failed), after_check = failed.substr(in_check.size());
  const auto times = [](int count, const std::string& trace) { return Joined(Strings(count, trace)); };
  struct Row {
    std::string trace, totals, first;
  };
  for (const Row& row : std::initializer_list<Row>{
           {in_tool + check, "2 runs: 1 ok, 0 problem, 1 unknown, 0 none", "unfinished: in tavtool"},
           {in_tool + launch, "2 runs: 1 ok, 0 problem, 1 unknown, 0 none", "unfinished: in tavtool"},
           {in_tool + in_tool + launch, "3 runs: 1 ok, 0 problem, 2 unknown, 0 none", "unfinished: in tavtool"},
           {UpTo("guihelper", launch) + launch, "2 runs: 1 ok, 0 problem, 1 unknown, 0 none", "unfinished: in guih"},
           {in_ruv + launch, "2 runs: 0 ok, 1 problem, 1 unknown, 0 none", "unfinished: in ruv"},
           {in_ruv + help + times(5, check) + after_ruv, "7 runs: 6 ok, 0 problem, 0 unknown, 1 none", "2.31: "},
           {in_ruv + times(19, check) + after_ruv, "20 runs: 20 ok, 0 problem, 0 unknown, 0 none", "2.31: "},
           {in_ruv + times(20, check) + after_ruv, "21 runs: 20 ok, 0 problem, 1 unknown, 0 none", "unfinished: in ruv"},
                      {in_tool + in_tool + after_tool, "2 runs: 1 ok, 0 problem, 1 unknown, 0 none", "unfinished: in tavtool"},
           {in_tool + in_tool + after_tool + after_tool, "2 runs: 0 ok, 0 problem, 2 unknown, 0 none", "mixed"},
           {in_tool + help + after_tool, "2 runs: 1 ok, 0 problem, 0 unknown, 1 none", "2.31: copy"},
           {in_tool + launch + after_tool, "2 runs: 0 ok, 0 problem, 2 unknown, 0 none", "mixed"},
           {in_check + in_tool + after_check + after_tool, "2 runs: 0 ok, 0 problem, 2 unknown, 0 none", "mixed"},
           {in_script + in_check + complaint + after_check + after_script, "2 runs: 0 ok, 2 problem, 0 unknown, 0 none",
            "copy script not run: Permission denied"},
           {in_script + Joined(Lines(check), 0, 9) + "x" + complaint + Joined(Lines(check), 9) + after_script,
            "2 runs: 2 ok, 0 problem, 0 unknown, 0 none", "2.31: copy script ran"},
           {in_ruv + in_script + after_ruv + after_script, "2 runs: 1 ok, 1 problem, 0 unknown, 0 none", "2.31: copy"},
           {after_tool + check, "2 runs: 1 ok, 0 problem, 1 unknown, 0 none", "its beginning is missing"},
           {after_ruv + launch, "1 run: 1 ok, 0 problem, 0 unknown, 0 none", "2.31: copy"},
           {Joined(Lines(launch), 0, 9) + Joined(Lines(launch), 10) + check,
            "2 runs: 1 ok, 0 problem, 1 unknown, 0 none", "mixed with another run, or lines are missing"}}) {
    const std::string report = ReportOf(row.trace);
    EXPECT_THAT(report, AllOf(HasSubstr(row.totals), ContainsRegex("\n  1 [a-z]+ +[1?].{7}[a-z?]+ +" + row.first)));
  }
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

TEST(RuvTrace, ClaimsNothingFalseAboutConcurrentRuns) {
  const Installation machine;
  machine.CreateRepository();
  machine.Install("tavtool",
                  "for word; do case $word in -c*) sleep 0.0${word#-c}; exit ${word#-c} ;; esac; done\n"
                  "[ $1 != comparelocal ] || sleep 0.02");
  std::vector<Strings> traces;
  for (const Strings& arguments :
       {Strings{"-b"}, {"--update", "-c1"}, {"-r"}, {"--chkupd", "-c42"}, {"--update", "-c31"}, {"-b", "x"}}) {
    std::filesystem::remove(kTraceFile);
    machine.Run(arguments);
    traces.push_back(Lines(ReadFile(kTraceFile)));
  }
  std::filesystem::remove(kTraceFile);
  std::string all;
  for (int i = 0; i < 30; ++i) {
    const std::string number = std::to_string(i);
    all += "sleep 0.02; \"$0\" -b -n" + number + " & \"$0\" --update -c" + number + " & ";
  }
  machine.Run({"-b", "-n99"}, Prelude("{ " + all + "wait; } >/dev/null"));
  const std::vector<json> real = Runs();
  ASSERT_THAT(real, SizeIs(61));
  ExpectNothingFalse(real);
  EXPECT_EQ(real.back().at("verdict"), "ok");

  std::set<std::string> verdicts;
  for (unsigned seed = 400; seed < 440; ++seed) {
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
      running.erase(std::remove_if(running.begin(), running.end(), [](const Strings& rest) { return rest.empty(); }),
                    running.end());
    }
    ReportOf(trace);
    const std::vector<json> runs = Runs();
    EXPECT_THAT(runs, SizeIs(40));
    ExpectNothingFalse(runs);
    for (const json& run : runs) verdicts.insert(run.at("verdict").get<std::string>());
  }
  EXPECT_THAT(verdicts, ElementsAre("ok", "problem", "unknown"));
}

TEST(RuvTrace, HidesPasswordsAndControlCharacters) {
  const std::pair<Strings, std::string> rows[] = {
      {{"-t", "me:secret@host/a@b", "-v"}, "-t ***"},
      {{"-v", "--ipmi-lan=me:secret@h"}, "-v --ipmi-lan ***"},
      {{"--VMWARE-ESXI", "me:secret@h"}, "--vmware-esxi ***"},
      {{"--remote-zfld", "me:secret -secret@h"}, "--remote-zfld ***"},
      {{"-t", "\" -m secret"}, "-t ***"},
      {{"-t", "me:x\n-secret@h"}, "-t ***"},
      {{"x\n-t", "secret-"}, "x\\n-t ***"},
      {{"--proxy-user=me", "--Proxy-Password=x 2>secret -x"}, "--proxy-user=me --Proxy-Password ***"},
      {{"--proxy-user=me:secret"}, "--proxy-user ***"},
      {{"--proxy-address=h", "--proxy-port=8"}, "--proxy-address=h --proxy-port=8"},
      {{"--proxy-address=http://me:secret@h", "-v"}, "--proxy-address ***"},
      {{"-text", "-x-t", "\\\"\xc3\xb6\x07\x7f\n\xfe-"}, "-text -x-t \\\"\\u00f6\\u0007\\u007f\\n\\ufffd-"},
  };
  const Installation machine;
  for (const auto& [arguments, shown] : rows) {
    machine.Run(arguments);
    const std::string report = Report("--long");
    EXPECT_THAT(report, HasSubstr("/ruv\" " + shown + " 2>/dev/null\n"));
    for (const std::string& option : {" --long", " --json", " --check", " --check --json"}) {
      EXPECT_THAT(Report(option), Not(AnyOf(HasSubstr("secret"), ContainsRegex("[\x01-\x09\x0b-\x1f\x7f-\xff]"))));
    }
    EXPECT_EQ(Report("--long --show-passwords").find("secret") != std::string::npos,
              report.find("***") != std::string::npos);
    std::filesystem::remove(kTraceFile);
  }
  EXPECT_THAT(ReportOf(TraceOf({"--chkupd", "--proxy-password=secret"}), "--long"),
              HasSubstr(" -m 1234 -o rhel5 -a 64 --latest --proxy-password *** 2>/dev/null 1>/dev/null 2>&1\n"));
  WriteFile(kSystemInformationFile, "ZEM_SYSTEM_MT=\xc3\xa4\xe2\x82\xac\x1b\xff\n");
  std::filesystem::remove(kTraceFile);
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  1 ok      \\u00... launch"));
  EXPECT_EQ(Runs().at(0).at("machine_type"), "\xc3\xa4\xe2\x82\xac\x1b\xef\xbf\xbd");
}

TEST(RuvTrace, SurvivesDamage) {
  const std::string trace = TraceOf({"-b"}) + TraceOf({"--update"}) + TraceOf({"--ipmi-lan"});
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
    for (const std::string& line : Lines(ReportOf(damaged, "--long"))) {
      EXPECT_THAT(line, Not(ContainsRegex("[\x01-\x09\x0b-\x1f\x7f-\xff]")));
      EXPECT_TRUE(line.substr(0, 6) == "      " || line.size() <= 80U + 1) << line;
    }
    EXPECT_THAT(Runs(), Not(IsEmpty()));
  }
}

TEST(RuvTrace, JudgesTheLastRun) {
  const std::string ok = TraceOf({"-b"}, {{"comparelocal", 0}}), bad = TraceOf({"-b"}, {{"expand", 60}});
  const std::string look = TraceOf({"--chkupd"}), bad_look = TraceOf({"--chkupd"}, {{"compareweb", 42}});
  const std::string help = TraceOf({"-h"}), cut = UpTo("TAVToolCmd", ok);
  const std::string ok_line = "ok: package: nothing newer; ruv started (run ";
  const std::string bad_line =
      "problem: expand 60: Error, package corrupted or not enough free space on disk; ruv started";
  const std::string look_line = "ok: package: available; ruv not started (run ";
  const std::string bad_look_line =
      "problem: compareweb 42: Unable to connect to update website; ruv not started (run ";
  const std::pair<std::string, std::string> rows[] = {
      {bad + ok, ok_line + "2)\n"},
      {ok + look, ok_line + "1)\n"},
      {bad + look, bad_line + " (run 1)\nstatus 2"},
      {ok + bad_look, bad_look_line + "2)\nstatus 2"},
      {ok + bad_look + look, ok_line + "1)\n"},
      {bad + bad_look, bad_line + " (run 1)\nstatus 2"},
      {bad_look + ok, ok_line + "2)\n"},
      {look, look_line + "1)\n"},
      {ok + help, ok_line + "1)\n"},
      {bad_look + help, bad_look_line + "1)\nstatus 2"},
      {ok + cut, "unknown: unfinished: in tavtool (run 2)\nstatus 3"},
      {cut + ok, ok_line + "2)\n"},
      {help, "unknown: no run that launched or updated\nstatus 3"},
      {"[TAVRUV]: text\n", "unknown: no run of the launcher in /var/log/ZEM_Support/ruvtav.log\nstatus 3"},
  };
  for (const auto& [trace, line] : rows) {
    EXPECT_EQ(ReportOf(trace, "--check"), line);
    const std::string status = line.substr(line.find('\n') + 1), text = Report("--check --json");
    EXPECT_EQ(text.substr(text.find('\n') + 1), status);
    EXPECT_EQ(json::parse(text.substr(0, text.find('\n'))).at("verdict"), line.substr(0, line.find(':')));
  }
  EXPECT_EQ(ReportOf(ok + help + bad, "--problems"),
            kHeader +
                "  3 problem 1234    launch expand 60: Error, package corrupted o...; ruv started\n"
                "3 runs: 1 ok, 1 problem, 0 unknown, 1 none\n");
  const std::string touch = std::string("touch -d '61 days ago' ") + kTraceFile + ";";
  ReportOf(ok);
  EXPECT_EQ(Report("--check --max-age=61", touch), ok_line + "1)\n");
  EXPECT_EQ(Report("--check --max-age=60"), "problem: no run for 61 days\nstatus 2");
  EXPECT_EQ(Report("--check --json --max-age=0 | grep -c '\"run\":0,\"verdict\":\"problem\"'"), "1\n");
  ReportOf(bad);
  EXPECT_EQ(Report("--check --max-age=1", touch), bad_line + " (run 1)\nstatus 2");
}

TEST(RuvTrace, ReadsFilesInOrderAndRefusesOthers) {
  const Installation machine;
  const std::string trace = TraceOf({"-b"}), half = UpTo("TAVToolCmd", trace), rest = trace.substr(half.size());
  const std::string rotated = std::string(kTraceFile) + ".1", dated = std::string(kTraceFile) + "-20260301";
  const std::string one = "\n1 run: 1 ok, 0 problem, 0 unknown, 0 none\n", file = machine.Directory() + "/old";
  WriteFile(rotated, half);
  EXPECT_THAT(ReportOf(rest), EndsWith(one));
  EXPECT_EQ(Runs().at(0).at("file"), rotated);
  EXPECT_THAT(Report(std::string("- ") + kTraceFile + " <" + rotated), EndsWith(one));
  EXPECT_THAT(ReportOf("x\n" + trace, "--json"), HasSubstr("ruvtav.log\",\"line\":2,\"run\":2,"));
  WriteFile(dated + ".gz", "x");
  WriteFile(dated, trace);  // the newest
  std::filesystem::last_write_time(rotated, std::filesystem::last_write_time(dated) - std::chrono::hours(999));
  EXPECT_THAT(ReportOf(""), EndsWith(one));
  EXPECT_THAT(Report("--check --max-age=1", "touch -d '3 days ago' " + dated + ";"), HasSubstr("no run for 3 days"));
  std::filesystem::remove(kTraceFile);
  EXPECT_THAT(Report("--check"), StartsWith("ok: "));
  EXPECT_EQ(Report(dated + " /etc/passwd | tail -n 1"),
            "ruv-trace: no run of the launcher in /etc/passwd\n" + one.substr(1));
  for (const auto& [compress, read] :
       std::map<std::string, std::string>{{"gzip", "zcat"}, {"xz", "xzcat"}, {"bzip2", "bzcat"}, {"zstd", "zstdcat"}}) {
    WriteFile(file, trace);
    if (std::system((compress + " <" + file + " >" + file + ".x 2>/dev/null").c_str()) != 0) continue;
    EXPECT_EQ(Report("--check " + file + " " + file + ".x"),
              "unknown: " + file + ".x is compressed: in bash, write <(" + read + " " + file + ".x) instead\nstatus 3");
  }
  EXPECT_THAT(Report("--check /tmp/none"), "unknown: cannot read /tmp/none: No such file or directory\nstatus 3");
  EXPECT_THAT(Report("/tmp"), EndsWith("cannot read /tmp: Is a directory\nstatus 1"));
  std::filesystem::permissions(dated, std::filesystem::perms::none);
  EXPECT_EQ(Report("--check", "setpriv --bounding-set -dac_override,-dac_read_search"),
            "unknown: cannot read " + dated + ": Permission denied; root can\nstatus 3");
  EXPECT_THAT(ReportOf(trace, ">/dev/full"), EndsWith("cannot write: No space left on device\nstatus 1"));
  EXPECT_THAT(Report("--check >/dev/full"), EndsWith("cannot write: No space left on device\nstatus 3"));
  std::filesystem::remove_all(kTraceDirectory);
  EXPECT_THAT(Report(), EndsWith("cannot read /var/log/ZEM_Support/ruvtav.log: No such file or directory\nstatus 1"));
  // A line longer than every buffer, and the one that follows it without a line feed.
  EXPECT_THAT(ReportOf(std::string(3'000'000, 'x') + "\n" + std::string(200'000, 'x') + trace), EndsWith(one));
}

TEST(RuvTrace, PrintsHelpVersionAndUsageErrors) {
  const std::string help = Report("--help");
  EXPECT_EQ(help, Report("-h"));
  EXPECT_THAT(help, StartsWith("Usage: ruv-trace [OPTION]... [FILE]...\n"));
  EXPECT_THAT(Lines(help), AllOf(SizeIs(Le(20U)), Each(SizeIs(Le(81U)))));
  EXPECT_THAT(Report("--version"), MatchesRegex("ruv-trace [0-9]+\\.[0-9]+\\.[0-9]+\n"));
  EXPECT_THAT(Report("--help >/dev/full"), EndsWith("status 1"));
  EXPECT_THAT(Report("--no-such-option"), EndsWith("Try ruv-trace --help.\nstatus 64"));
  for (const char* days : {"", "-1", "x", "1x"}) {
    EXPECT_THAT(Report(std::string("--check --max-age=") + days), EndsWith("Try ruv-trace --help.\nstatus 64"));
  }
}
