// ruv-trace's reports, also of concurrent runs and damaged traces.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <nlohmann/json.hpp>
#include <random>
#include <regex>
#include <sstream>

#include "installation.h"

using nlohmann::json;
using testing::ContainsRegex;

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

Strings Split(const std::string& text, char end) {
  std::istringstream stream(text);
  Strings parts;
  for (std::string part; std::getline(stream, part, end);) parts.push_back(part);
  return parts;
}

// Returns the columns, separated by "|" and without blanks around them, of each line.
std::vector<Strings> Table(const std::string& text) {
  std::vector<Strings> rows;
  for (const std::string& line : Split(text, '\n')) {
    rows.push_back(Split(std::regex_replace(line, std::regex("^ +| *(\\|) *"), "$1"), '|'));
  }
  return rows;
}

std::string Joined(const Strings& lines, std::size_t begin = 0, std::size_t end = -1) {
  std::string text;
  for (std::size_t i = begin; i < std::min(end, lines.size()); ++i) text += lines[i] + "\n";
  return text;
}

json RunOf(const std::string& trace) { return json::parse(Split(ReportOf(trace, "--json"), '\n').back()); }

// Returns the listing of the last run, without its number, with single blanks.
std::string LastRun(const std::string& trace) {
  const Strings lines = Split(ReportOf(trace), '\n');
  return lines.size() < 3 ? "" : std::regex_replace(lines[lines.size() - 2].substr(4), std::regex(" +"), " ");
}

// Runs the launcher where a package can be installed, and returns the trace.
std::string TraceOf(const Strings& arguments, std::map<std::string, int> tool_codes = {},
                    const std::string& medium = "") {
  const Installation machine;
  machine.CreateRepository();
  tool_codes.emplace("comparelocal", 21);
  machine.InstallTool(tool_codes, "Version=2.31\n");
  machine.InstallCopyScript("echo copied");
  fs::create_directories(machine.Directory() + "/media/update");
  const std::string path = medium.empty() ? "" : machine.Directory() + medium;
  machine.Run(arguments, Environment("ZEM_PORTABLE_EXEC_DIR", path));
  return machine.Trace();
}

// Returns the trace up to and with the line that contains the text.
std::string UpTo(const std::string& text, const std::string& trace) {
  return trace.substr(0, trace.find('\n', trace.find(text)) + 1);
}

}  // namespace

TEST(RuvTrace, FollowsTheLauncherStepByStep) {
  // The state of a run after each line: that of the first row whose text the line contains.
  const std::vector<Strings> states = Table(R"(
      Entering TAVMaster::GetTAVBinaryPath  | unknown the launcher's directory was not found, or unfinished
      TAVMaster: command =                  | unknown unfinished: in guihelper.sh
      Entering TAVMaster::ParseParameters   | none help shown
      Unknown Parameter                     | none help shown
      Exiting TAVMaster::ParseParameters    | none options rejected
      TAVToolCmd                            | unknown unfinished: in tavtool
      CopyTAVToRUVFoler: command            | unknown unfinished: in the copy script
      copied                                | unknown unfinished: in the copy script
      InvokeRUV: command                    | unknown unfinished: in ruv or at the question before it
      TAV                                   | unknown unfinished: between two steps
      [                                     | unknown unfinished: between two steps)");
  const Strings launch = {"-b", "--one", "--two", "-d", "x"};
  for (const std::string& trace : {TraceOf(launch, {}, "/media"), TraceOf({"-b"}, {}, "/none"), TraceOf({"--update"}),
                                   TraceOf({"--update"}, {}, "/media"), TraceOf({"--chkupd"}), TraceOf({"--ipmi-lan"}),
                                   TraceOf({"--update"}, {{"compareweb", 40}})}) {
    const Strings lines = Split(trace, '\n');
    EXPECT_THAT(LastRun(trace), StartsWith("ok 1234 "));
    for (std::size_t i = 0; i + 1 < lines.size(); ++i) {
      SCOPED_TRACE(lines[i]);
      const auto is = [&](const std::string& text) { return lines[i].find(text) != std::string::npos; };
      std::size_t state = 1;
      while (!is(states[state][0])) ++state;
      const json run = RunOf(Joined(lines, 0, i + 1));
      EXPECT_EQ(run.at("verdict").get<std::string>() + " " + run.at("reason").get<std::string>(), states[state][1]);
      // Not in every run: these lines. While the copy script runs, any line may be its own.
      if (is("mkdir") || is("copied") || is("special parameters") || is("Unknown Parameter")) continue;
      const std::string before = Joined(lines, 0, i), after = Joined(lines, i + 1);
      EXPECT_THAT(LastRun(before + after), StartsWith("unknown "));
      if (i == 0 || i + 5 > lines.size() || is("CopyTAVToRUVFoler: command")) continue;  // the last ones say nothing
      EXPECT_THAT(LastRun(before + lines[i] + "\n" + lines[i] + "\n" + after), StartsWith("unknown "));
      const std::string swapped = before + lines[i + 1] + "\n" + lines[i] + "\n" + Joined(lines, i + 2);
      EXPECT_THAT(LastRun(swapped), StartsWith(lines[i] == lines[i + 1] ? "ok " : "unknown "));
    }
  }
}

TEST(RuvTrace, ReportsWhatARunDid) {
  for (const Strings& row : Table(
           R"(-b                    | comparelocal 0   | ok 1234 launch package: nothing newer; ruv started
              -r x                  | comparelocal 0   | ok 1234 launch package: nothing newer; ruv started
              -i /d/1234.xml        | comparelocal 0   | ok 1234 launch package: nothing newer; ruv started
              -v                    | comparelocal 0   | ok 1234 launch package: nothing newer; ruv started or declined
              -d -b                 | comparelocal 0   | ok 1234 launch package: nothing newer; ruv started or declined
              -d x%-b%y             | comparelocal 0   | ok 1234 launch package: nothing newer; ruv started or declined
              -d --show_stderr      | comparelocal 0   | problem 1234 launch option -d has no value; ruv started or declined
              --vmware-esxi h       | x 0              | ok 1234 launch package: not checked; ruv started
              -v                    | expand 52        | ok 1234 launch 2.31: copy script ran; ruv started
              -b                    | comparelocal 52  | ok 1234 launch package: nothing newer; ruv started
              --chkupd              | x 0              | ok 1234 check package: available; ruv not started
              --update              | compareweb 40    | ok 1234 check package: nothing newer; ruv not started
              --update              | comparelocal 0   | ok 1234 update package: nothing newer; ruv not started
              --update --update_m 5 | x 0              | ok 5 update 2.31: copy script ran; ruv not started
              -b                    | expand 60        | problem 1234 launch expand 60: Error, package corrupted o...; ruv started
              -b                    | comparelocal 127 | problem 1234 launch comparelocal 127: tavtool not found, ...; ruv started
              --chkupd              | compareweb 42    | problem 1234 check compareweb 42: Unable to connect to update website
              --chkupd              | compareweb 61    | problem 1234 check compareweb 61: unexpected exit code; ruv not started
              --update              | acquire 31       | problem 1234 update acquire 31: There's no update available for this s...
              -h                    | x 0              | none 1234 ? help shown
              --update_m 1          | x 0              | none 1234 ? options rejected)")) {
    SCOPED_TRACE(row[2]);
    Strings arguments = Split(row[0], ' ');
    for (std::string& argument : arguments) std::replace(argument.begin(), argument.end(), '%', ' ');
    EXPECT_EQ(LastRun(TraceOf(arguments, {{Split(row[1], ' ')[0], std::stoi(Split(row[1], ' ')[1])}})), row[2]);
    const auto count = [&](char verdict) { return row[2][0] == verdict ? "1 " : "0 "; };
    EXPECT_THAT(Report(), EndsWith(std::string("\n1 run: ") + count('o') + "ok, " + count('p') +
                                   "problem, 0 unknown, " + count('n') + "none\n"));
  }
  const Installation machine;
  fs::remove(kSystemInformationFile);
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  1 problem unknown launch machine unknown: no system information; ruv started\n"));
}

TEST(RuvTrace, GivesTheMeaningOfExitCodes) {
  const std::string web = TraceOf({"--update"}), local = TraceOf({"-b"}, {}, "/media");
  for (const Strings& row : Table(
           R"(copy         | 0   | ok      | success                                         | unknown
              copy         | 1   | problem | Invalid command parameter specified             | unknown
              copy         | 30  | ok      | You already have the latest version RUV         | unknown
              comparelocal | 0   | ok      | nothing newer                                   | nothing_newer
              comparelocal | 21  | ok      | newer package                                   | available
              comparelocal | 61  | ok      | no payload                                      | nothing_newer
              comparelocal | -1  | problem | the shell could not be started or waited for    | check_failed
              comparelocal | 126 | problem | tavtool cannot be executed                      | check_failed
              comparelocal | 127 | problem | tavtool not found, or no shell could be started | check_failed
              comparelocal | 128 | problem | unknown exit code                               | check_failed
              comparelocal | 129 | problem | unknown exit code, or ended by a signal         | check_failed
              expand       | 0   | ok      | success                                         | expanded
              expand       | 52  | ok      | no payload                                      | expanded
              expand       | 21  | problem | unexpected exit code                            | expansion_failed
              expand       | 30  | problem | You already have the latest version RUV         | expansion_failed
              compareweb   | 0   | ok      | update available                                | available
              compareweb   | 30  | ok      | You already have the latest version RUV         | nothing_newer
              compareweb   | 52  | problem | unexpected exit code                            | check_failed
              acquire      | 32  | ok      | success                                         | downloaded
              acquire      | 30  | problem | You already have the latest version RUV         | download_failed)")) {
    const std::string& trace = row[0] == "compareweb" || row[0] == "acquire" ? web : local;
    const std::size_t code = trace.find("= ", trace.find("Return Code", trace.find(" " + row[0] + " -l "))) + 2;
    const json run = RunOf(trace.substr(0, code) + row[1] + "\n"), call = run.at("tool_calls").back();
    EXPECT_EQ(call.at("verb"), row[0]);
    EXPECT_EQ(call.at("exit_code"), std::stoi(row[1]));
    EXPECT_EQ(call.at("result"), row[2]) << row[0] << row[1];
    EXPECT_EQ(call.at("meaning"), row[3]);
    EXPECT_EQ(run.at("package"), row[4]);
    EXPECT_EQ(run.at("verdict"), row[2] == "ok" ? "unknown" : "problem");
  }
  for (const int code : {31, 33, 40}) {
    EXPECT_THAT(LastRun(TraceOf({"--chkupd"}, {{"compareweb", code}})), StartsWith("ok 1234 check package: nothing"));
  }
}

TEST(RuvTrace, ReportsInstallations) {
  const Installation machine;
  machine.OfferPackage();
  const auto offer = [&](int code, const std::string& version = "2.31") {
    machine.InstallTool({{"comparelocal", code}, {"compareweb", code}}, "Version=" + version + "\n");
  };
  const auto run = [&](const Strings& arguments = {"-b"}) {
    machine.Run(arguments);
    return LastRun(ReadFile(kTraceFile));
  };
  const std::string ran = ": copy script ran; ruv started";
  int version = 100;
  for (const char* script : {"printf x", "exit 3", "rm \"$0\"", "echo sh: \"$0\"; echo \"x $0: y\"",
                             "printf '[TAVRUV]: [Status:]Return Code from tavtool = 9\\n[TAVRUV]: x\\nno line feed'"}) {
    machine.InstallCopyScript(script);
    offer(21, std::to_string(++version));
    EXPECT_EQ(run(), "ok 1234 launch " + std::to_string(version) + ran) << script;
  }
  const std::string script = std::string(kExpansionDirectory) + "/ruv/data/copy.sh";
  offer(21);
  WriteFile(script, "#!/no/such/shell\n");
  EXPECT_EQ(run(), "problem 1234 launch copy script not run: not found; ruv started");
  EXPECT_EQ(RunOf(ReadFile(kTraceFile)).at("package"), "copy_script_not_run");
  machine.InstallCopyScript();
  EXPECT_EQ(run(), "ok 1234 launch 2.31" + ran);
  machine.InstallTool({{"comparelocal", 21}}, "Version=2.31\n");
  EXPECT_EQ(run({"--update", "--update_m", "5678"}), "ok 5678 update 2.31: copy script ran; ruv not started");
  EXPECT_EQ(run(), "ok 1234 launch 2.31" + ran);
  offer(31);
  EXPECT_THAT(run({"--chkupd"}), StartsWith("ok "));  // says nothing about the installed package
  offer(21);
  EXPECT_EQ(run(), "problem 1234 launch 2.31 installed again, or a version th...; ruv started");
  offer(0);
  EXPECT_THAT(run(), StartsWith("ok 1234 launch package: nothing newer"));  // now it did take
  offer(21);
  EXPECT_EQ(run(), "ok 1234 launch 2.31" + ran);
  fs::remove(script);
  EXPECT_EQ(run(), "problem 1234 launch the package has no copy script; ruv started");
  EXPECT_EQ(RunOf(ReadFile(kTraceFile)).at("package"), "no_copy_script");
}

TEST(RuvTrace, ShowsCommands) {
  const std::string launch = TraceOf({"-b"}), begin = "[TAVRUV]: [Status:]InvokeRUV: command = ", x(457, 'x');
  const std::size_t command = launch.find(begin) + begin.size();
  const std::string rest = launch.substr(launch.find('\n', command) + 1), end = " 2>/dev/null";
  for (const auto& [traced, shown] : std::vector<std::pair<std::string, std::string>>{
           {"ruv \"x\ny\"" + end + "\nbackground", "ruv \"x\ny\"" + end},
           {"ruv" + end + "\nbackground", "ruv" + end},
           {"ruv -b\nbackground", "ruv -b..."},  // --show_stderr
           {x + "12345678901" + end, x + "12345678901" + end},
           {x + "123456789012" + end, x + "123456789012" + end + "..."},
           {x + "1234567890123" + end, x + "1234567890123 2>/dev/nul..."}}) {
    const json run = RunOf(launch.substr(0, command) + traced.substr(0, 481) + "\n" + rest);
    EXPECT_EQ(run.at("command").get<std::string>() + (run.at("command_cut") ? "..." : ""), shown);
    EXPECT_EQ(run.at("verdict"), "ok");
  }
  EXPECT_THAT(Report("--long"), HasSubstr("2>/dev/nul...\n"));
}

TEST(RuvTrace, PrintsEveryField) {
  const std::string trace = TraceOf({"-b"}, {}, "/media"),
                    listing = R"(  1 ok      1234    launch 2.31: copy script ran; ruv started
      line 1 of /var/log/ZEM_Support/ruvtav.log, machine 1234 rhel5/64
      copy 0: success
        "@/tavtool" copy -l "@/media/update" -t "/var/ZEM_Support" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1
      comparelocal 21: newer package
        "@/tavtool" comparelocal -l "/var/ZEM_Support" -s "@" -m 1234 -o rhel5 -a 64 1>tav.log 2>&1
      expand 0: success
        @/tavtool expand -l "/var/ZEM_Support" -t "/tmp/tav" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1
      command: "@/ruv" -b 2>/dev/null
1 run: 1 ok, 0 problem, 0 unknown, 0 none
)";
  EXPECT_EQ(ReportOf(trace, "--long"), kHeader + listing);
  EXPECT_EQ(ReportOf(UpTo("CopyPortableTAVToRepository: TAVToolCmd", trace), "--json"),
            R"({"file":"/var/log/ZEM_Support/ruvtav.log","line":1,"run":1,"verdict":"unknown",)"
            R"("reason":"unfinished: in tavtool","machine_type":"1234","operating_system":"rhel5","architecture":"64",)"
            R"("mode":"launch","package":"unknown","package_version":null,"ruv":"unknown","command":null,)"
            R"("command_cut":false,"tool_calls":[{"verb":"copy","exit_code":null,"result":"unknown",)"
            R"("meaning":"no exit code","command":"\"@/tavtool\" copy -l \"@/media/update\" -t )"
            R"(\"/var/ZEM_Support\" -m 1234 -o rhel5 -a 64 1>/dev/null 2>&1","command_cut":false}]})"
            "\n");
  EXPECT_THAT(Report("--long"), HasSubstr("64\n      reason: unfinished: in tavtool\n      copy: no exit code\n"));
  const json complete = RunOf(trace);
  EXPECT_EQ(complete.at("package_version"), "2.31");
  EXPECT_EQ(complete.at("ruv"), "started");
  EXPECT_TRUE(complete.at("reason").is_null());
  EXPECT_THAT(ReportOf(trace.substr(trace.find('\n') + 1), "--long"),
              HasSubstr("  1 unknown ?       ?      its beginning is missing\n      line 1 of /var/log/ZEM_Support/"
                        "ruvtav.log, machine ? ?/?\n      reason: its beginning is missing\n1 run: "));
}

TEST(RuvTrace, FollowsConcurrentRuns) {
  const std::string launch = TraceOf({"-b"}), failed = TraceOf({"--chkupd"}, {{"compareweb", 42}});
  std::map<std::string, std::string> pieces = {
      {"launch", launch},          {"check", TraceOf({"--chkupd"})},
      {"help", TraceOf({"-h"})},   {"complaint", "sh: 1: /tmp/tav/ruv/data/copy.sh: Permission denied\n"},
      {"prefix", "[TAVRUV]: x\n"}, {"damaged", std::regex_replace(launch, std::regex(".*MT = .*\n"), "")}};
  const auto cut = [&](const std::string& name, const std::string& text, const std::string& trace) {
    pieces["in_" + name] = UpTo(text, trace);
    pieces["after_" + name] = trace.substr(pieces["in_" + name].size());
  };
  cut("helper", "guihelper.sh", launch);
  cut("tool", "CompareTAVPackage: TAVToolCmd", launch);
  cut("script", "CopyTAVToRUVFoler: command", launch);
  cut("ruv", "InvokeRUV: command", launch);
  cut("check", "TAVToolCmd", failed);
  // The pieces, the numbers of verdicts (ok, problem, unknown, none), and what is said of the first run.
  for (
      const Strings& row : Table(
          R"(in_helper launch                              | 1 0 1 0  | unknown \?       \?      unfinished: in guihelper
              in_tool launch                                | 1 0 1 0  | unknown 1234    launch unfinished: in tavtool
              in_ruv check                                  | 1 0 1 0  | unknown 1234    launch unfinished: in ruv
              in_tool in_tool launch                        | 1 0 2 0  | unknown 1234    launch unfinished: in tavtool
              in_tool help after_tool                       | 1 0 0 1  | ok      1234    launch 2.31
              in_ruv help check check after_ruv             | 3 0 0 1  | ok      1234    launch 2.31
              in_ruv 19check after_ruv                      | 20 0 0 0 | ok      1234    launch 2.31
              in_ruv 20check after_ruv                      | 20 0 1 0 | unknown 1234    launch unfinished: in ruv
              in_tool in_tool after_tool                    | 1 0 1 0  | unknown 1234    launch unfinished: in tavtool
              in_tool in_tool after_tool after_tool         | 0 0 2 0  | unknown \?       \?      mixed
              in_tool launch after_tool                     | 0 0 2 0  | unknown \?       \?      mixed
              in_check in_tool after_check after_tool       | 0 0 2 0  | unknown \?       \?      mixed
              in_script in_check complaint after_check after_script | 0 2 0 0 | problem 1234    launch copy script not run: Perm
              in_script in_check after_check after_script   | 1 1 0 0  | ok      1234    launch 2.31
              in_ruv in_script after_ruv after_script       | 1 1 0 0  | ok      1234    launch 2.31
              after_tool check                              | 1 0 1 0  | unknown \?       \?      its beginning is missing
              after_ruv prefix launch                       | 1 0 0 0  | ok      1234    launch 2.31
              in_ruv prefix after_ruv                       | 0 0 1 0  | unknown \?       \?      mixed
              damaged check                                 | 1 0 1 0  | unknown \?       \?      mixed)")) {
    std::string trace;
    for (const std::string& word : Split(row[0], ' ')) {
      const std::size_t digits = word.find_first_not_of("0123456789");
      const int times = digits == 0 ? 1 : std::stoi(word);
      for (int i = 0; i < times; ++i) trace += pieces.at(word.substr(digits));
    }
    const Strings counts = Split(row[1], ' ');
    EXPECT_THAT(ReportOf(trace), AllOf(HasSubstr(": " + counts[0] + " ok, " + counts[1] + " problem, " + counts[2] +
                                                 " unknown, " + counts[3] + " none"),
                                       ContainsRegex("\n  1 " + row[2])))
        << row[0];
  }
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
    fs::remove(kTraceFile);
  }
  EXPECT_THAT(ReportOf(TraceOf({"--chkupd", "--proxy-password=secret"}), "--long"),
              HasSubstr(" -m 1234 -o rhel5 -a 64 --latest --proxy-password *** 2>/dev/null 1>/dev/null 2>&1\n"));
  WriteFile(kSystemInformationFile, "ZEM_SYSTEM_MT=\xc3\xa4\xe2\x82\xac\x1b\xff\n");
  fs::remove(kTraceFile);
  machine.Run({"-b"});
  EXPECT_THAT(Report(), HasSubstr("  1 ok      \\u00... launch"));
  EXPECT_EQ(RunOf(ReadFile(kTraceFile)).at("machine_type"), "\xc3\xa4\xe2\x82\xac\x1b\xef\xbf\xbd");
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
    for (const std::string& line : Split(ReportOf(damaged, "--long"), '\n')) {
      EXPECT_THAT(line, Not(ContainsRegex("[\x01-\x09\x0b-\x1f\x7f-\xff]")));
      EXPECT_TRUE(line.substr(0, 6) == "      " || line.size() <= 80U) << line;
    }
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
  EXPECT_EQ(json::parse(Report("--json")).at("file"), rotated);
  EXPECT_THAT(Report(std::string("- ") + kTraceFile + " <" + rotated), EndsWith(one));
  EXPECT_THAT(ReportOf("x\n" + trace, "--json"), HasSubstr("ruvtav.log\",\"line\":2,\"run\":2,"));
  WriteFile(dated + ".gz", "x");
  WriteFile(dated, trace);  // the newest
  fs::last_write_time(rotated, fs::last_write_time(dated) - std::chrono::hours(999));
  EXPECT_THAT(ReportOf(""), EndsWith(one));
  EXPECT_THAT(Report("--check --max-age=1", "touch -d '3 days ago' " + dated + ";"), HasSubstr("no run for 3 days"));
  fs::remove(kTraceFile);
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
  fs::permissions(dated, fs::perms::none);
  EXPECT_EQ(Report("--check", "setpriv --bounding-set -dac_override,-dac_read_search"),
            "unknown: cannot read " + dated + ": Permission denied; root can\nstatus 3");
  EXPECT_THAT(ReportOf(trace, ">/dev/full"), EndsWith("cannot write: No space left on device\nstatus 1"));
  EXPECT_THAT(Report("--check >/dev/full"), EndsWith("cannot write: No space left on device\nstatus 3"));
  fs::remove_all(kTraceDirectory);
  EXPECT_THAT(Report(), EndsWith("cannot read /var/log/ZEM_Support/ruvtav.log: No such file or directory\nstatus 1"));
  // A line longer than every buffer, and the one that follows it without a line feed.
  EXPECT_THAT(ReportOf(std::string(3'000'000, 'x') + "\n" + std::string(200'000, 'x') + trace), EndsWith(one));
}

TEST(RuvTrace, PrintsHelpVersionAndUsageErrors) {
  const std::string help = Report("--help");
  EXPECT_EQ(help, Report("-h"));
  EXPECT_THAT(help, StartsWith("Usage: ruv-trace [OPTION]... [FILE]...\n"));
  EXPECT_THAT(Split(help, '\n'), AllOf(SizeIs(testing::Le(20U)), testing::Each(SizeIs(testing::Le(80U)))));
  EXPECT_THAT(Report("--version"), testing::MatchesRegex("ruv-trace [0-9]+\\.[0-9]+\\.[0-9]+\n"));
  EXPECT_THAT(Report("--help >/dev/full"), EndsWith("status 1"));
  EXPECT_THAT(Report("--no-such-option"), EndsWith("Try ruv-trace --help.\nstatus 64"));
  for (const char* days : {"", "-1", "x", "1x"}) {
    EXPECT_THAT(Report(std::string("--check --max-age=") + days), EndsWith("Try ruv-trace --help.\nstatus 64"));
  }
}
