// ruv-trace's reports, also of concurrent runs and damaged traces.
#include <nlohmann/json.hpp>
#include <regex>
#include <sstream>

#include "installation.h"

using nlohmann::json;
using testing::ContainsRegex;
using testing::MatchesRegex;

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

std::string Joined(const Strings& lines, std::size_t begin, std::size_t end = std::string::npos) {
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

// Runs the launcher where a package can be installed, and returns the trace. The launcher makes the repository itself
// if the portable medium is /media.
std::string TraceOf(const Strings& arguments, std::map<std::string, int> tool_codes = {},
                    const std::string& medium = "") {
  const Installation machine;
  if (medium != "/media") machine.CreateRepository();
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

// Returns a trace put together from the pieces with these names; "3x" is three times x.
std::string Composed(const std::string& names, const std::map<std::string, std::string>& pieces) {
  std::string trace;
  for (const std::string& name : Split(names, ' ')) {
    const std::size_t digits = name.find_first_not_of("0123456789");
    for (int i = digits == 0 ? 1 : std::stoi(name); i > 0; --i) trace += pieces.at(name.substr(digits));
  }
  return trace;
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
  for (const std::string& trace :
       {TraceOf(launch, {}, "/media"), TraceOf({"-b"}, {}, "/none"), TraceOf({"--update"}),
        TraceOf({"--update"}, {}, "/media"), TraceOf({"--update"}, {}, "/none"), TraceOf({"--chkupd"}),
        TraceOf({"--ipmi-lan"}), TraceOf({"--update"}, {{"compareweb", 40}})}) {
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

TEST(RuvTrace, ReportsWhatARunDid) {
  const Installation machine;
  machine.OfferPackage();
  const std::string script = std::string(kExpansionDirectory) + "/ruv/data/copy.sh";
  // A verb of tavtool and its exit code, the copy script (nothing: none), the arguments, and the listing.
  for (const Strings& row : Table(
           R"(comparelocal 0   | : | -b               | ok 1234 launch package: nothing newer; ruv started
              comparelocal 0   | : | -r x             | ok 1234 launch package: nothing newer; ruv started
              comparelocal 0   | : | -i /d/1234.xml   | ok 1234 launch package: nothing newer; ruv started
              comparelocal 0   | : | -v               | ok 1234 launch package: nothing newer; ruv started or declined
              comparelocal 0   | : | -d -b            | ok 1234 launch package: nothing newer; ruv started or declined
              comparelocal 0   | : | -d x%-b%y        | ok 1234 launch package: nothing newer; ruv started or declined
              comparelocal 0   | : | -d --show_stderr | problem 1234 launch option -d has no value; ruv started or declined
              comparelocal 52  | : | -b               | ok 1234 launch package: nothing newer; ruv started
              comparelocal 127 | : | -b               | problem 1234 launch comparelocal 127: tavtool not found, ...; ruv started
              comparelocal 0   | : | --vmware-esxi h  | ok 1234 launch package: not checked; ruv started
              compareweb 0     | : | --chkupd         | ok 1234 check package: available; ruv not started
              compareweb 40    | : | --update         | ok 1234 check package: nothing newer; ruv not started
              compareweb 42    | : | --chkupd         | problem 1234 check compareweb 42: Unable to connect to update website
              compareweb 61    | : | --chkupd         | problem 1234 check compareweb 61: unexpected exit code; ruv not started
              comparelocal 0   | : | --update         | ok 1234 update package: nothing newer; ruv not started
              acquire 31       | : | --update         | problem 1234 update acquire 31: There's no update available for this s...
              expand 60        | : | -b               | problem 1234 launch expand 60: Error, package corrupted o...; ruv started
              comparelocal 0   | : | -h               | none 1234 ? help shown
              comparelocal 0   | : | --update_m 1     | none 1234 ? options rejected
              expand 52        | printf x | -v        | ok 1234 launch 2.31: copy script ran; ruv started
              compareweb 31    | : | --chkupd         | ok 1234 check package: nothing newer; ruv not started
              expand 52        | exit 3 | -b          | problem 1234 launch 2.31 installed again, or a version th...; ruv started
              comparelocal 0   | : | -b               | ok 1234 launch package: nothing newer; ruv started
              expand 0         | #!/no/such | -b      | problem 1234 launch copy script not run: not found; ruv started
              expand 0         | echo "x $0: y"; echo sh: $0 | -b | ok 1234 launch 2.31: copy script ran; ruv started
              expand 0         | : | --update --update_m 5678 | ok 5678 update 2.31: copy script ran; ruv not started
              expand 0         | rm "$0" | -b         | ok 1234 launch 2.31: copy script ran; ruv started
              expand 0         | : | -b -i /1/5678    | ok 5678 launch 2.31: copy script ran; ruv started
              expand 0         | printf '[TAVRUV]: [Status:]Return Code from tavtool = 9\n[TAVRUV]: x\nno line feed' | -b | ok 1234 launch 2.31: copy script ran; ruv started
              expand 0         | | -b                 | problem 1234 launch the package has no copy script; ruv started)")) {
    SCOPED_TRACE(Joined(row, 0));
    const Strings call = Split(row[0], ' ');
    const int comparison = call[0] == "comparelocal" ? std::stoi(call[1]) : 21;
    machine.InstallTool({{"comparelocal", comparison}, {call[0], std::stoi(call[1])}}, "Version=2.31\n");
    machine.InstallCopyScript(row[1]);
    if (row[1][0] == '#') WriteFile(script, row[1] + "\n");
    if (row[1].empty()) fs::remove(script);
    Strings arguments = Split(row[2], ' ');
    for (std::string& argument : arguments) std::replace(argument.begin(), argument.end(), '%', ' ');
    machine.Run(arguments);
    EXPECT_EQ(LastRun(ReadFile(kTraceFile)), row[3]);
  }
  EXPECT_THAT(Report(), EndsWith("30 runs: 19 ok, 9 problem, 0 unknown, 2 none\n"));
  EXPECT_THAT(Report("--json"), AllOf(HasSubstr("\"copy_script_not_run\""), HasSubstr("\"no_copy_script\"")));
  fs::remove(kSystemInformationFile);
  machine.Run({"--ipmi-lan"});
  EXPECT_EQ(LastRun(ReadFile(kTraceFile)),
            "problem unknown launch machine unknown: no system information; ruv started");
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
  EXPECT_THAT(ReportOf(trace, "--json"), AllOf(HasSubstr("\"package_version\":\"2.31\",\"ruv\":\"started\""),
                                               HasSubstr("\"verdict\":\"ok\",\"reason\":null")));
  EXPECT_THAT(ReportOf(trace.substr(UpTo("Exiting", trace).size()), "--long"),
              HasSubstr("  1 unknown ?       ?      its beginning is missing\n      line 1 of /var/log/ZEM_Support/"
                        "ruvtav.log, machine ? ?/?\n      reason: its beginning is missing\n1 run: "));
}

TEST(RuvTrace, FollowsConcurrentRuns) {
  const std::string launch = TraceOf({"-b"});
  std::map<std::string, std::string> pieces = {{"launch", launch}, {"check", TraceOf({"--chkupd"})}};
  pieces["help"] = TraceOf({"-h"});
  pieces["noisy"] = std::regex_replace(pieces["help"], std::regex("MT = .*\n"), "$&output of another program\n");
  pieces["prefix"] = "[TAVRUV]: x\n";
  pieces["complaint"] = "sh: 1: /tmp/tav/ruv/data/copy.sh: Permission denied\n";
  pieces["damaged"] = std::regex_replace(launch, std::regex(".*MT = .*\n"), "");
  for (const Strings& row : Table("helper|guihelper.sh\ntool|CompareTAVPackage: T\nscript|copy.sh\nruv|InvokeRUV: c")) {
    pieces["in_" + row[0]] = UpTo(row[1], launch);
    pieces["after_" + row[0]] = launch.substr(pieces["in_" + row[0]].size());
  }
  const std::string failed = TraceOf({"--chkupd"}, {{"compareweb", 42}});
  pieces["in_check"] = UpTo("TAVToolCmd", failed);
  pieces["after_check"] = failed.substr(pieces["in_check"].size());
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
              noisy                                         | 0 0 0 1  | none    1234    \?      help shown
              damaged check                                 | 1 0 1 0  | unknown \?       \?      mixed)")) {
    const std::string totals =
        std::regex_replace(row[1], std::regex("(.+) (.+) (.+) (.+)"), ": $1 ok, $2 problem, $3 unknown, $4 none\n");
    EXPECT_THAT(ReportOf(Composed(row[0], pieces)), AllOf(EndsWith(totals), ContainsRegex("\n  1 " + row[2])))
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
      {{"x\n-t", "me:x\n-secret@h"}, "x\\n-t ***"},
      {{"--proxy-user=me", "--Proxy-Password=x 2>secret -x"}, "--proxy-user=me --Proxy-Password ***"},
      {{"--proxy-user=me:secret"}, "--proxy-user ***"},
      {{"--proxy-address=h", "--proxy-port=8"}, "--proxy-address=h --proxy-port=8"},
      {{"--proxy-address=http://me:secret@h", "-v"}, "--proxy-address ***"},
      {{"-text", "-x-t", "\\\"\xc3\xb6\x07\x7f\n\xfe-"}, "-text -x-t \\\"\\u00f6\\u0007\\u007f\\n\\ufffd-"},
  };
  for (const auto& [arguments, shown] : rows) {
    EXPECT_THAT(ReportOf(TraceOf(arguments), "--long"), HasSubstr("/ruv\" " + shown + " 2>/dev/null\n"));
    for (const char* option : {"--long", "--json", "--check"}) {
      EXPECT_THAT(Report(option), Not(AnyOf(HasSubstr("secret"), ContainsRegex("[\x01-\x09\x0b-\x1f\x7f-\xff]"))));
    }
    EXPECT_EQ(Report("--long --show-passwords").find("secret") != std::string::npos,
              shown.find("***") != std::string::npos);
  }
  EXPECT_THAT(ReportOf(TraceOf({"--chkupd", "--proxy-password=secret"}), "--long"),
              HasSubstr(" -m 1234 -o rhel5 -a 64 --latest --proxy-password *** 2>/dev/null 1>/dev/null 2>&1\n"));
  const std::string type = "\xc3\xa4\xe2\x82\xac\x1b";
  const std::string trace = std::regex_replace(TraceOf({"-b"}), std::regex(" 1234"), " " + type);
  EXPECT_THAT(ReportOf(trace), HasSubstr("  1 ok      \\u00... launch"));
  EXPECT_EQ(RunOf(trace).at("machine_type"), type);
}

TEST(RuvTrace, JudgesTheLastRun) {
  const std::string ok = TraceOf({"-b"}, {{"comparelocal", 0}}), bad = TraceOf({"-b"}, {{"expand", 31}});
  const std::map<std::string, std::string> pieces = {
      {"ok", ok},
      {"bad", bad},
      {"look", TraceOf({"--chkupd"})},
      {"cut", UpTo("TAVToolCmd", ok)},
      {"bad_look", TraceOf({"--chkupd"}, {{"compareweb", 45}})},
      {"help", TraceOf({"-h"})},
      {"text", "[TAVRUV]: x\n"},
      {"cut_look", UpTo("TAVToolCmd", TraceOf({"--chkupd"}))},
      {"cut_update", UpTo("AcquireUpdate: TAVToolCmd", TraceOf({"--update"}))}};
  for (const Strings& row : Table(
           R"(bad ok           | 0 ok: package: nothing newer; ruv started (run 2)
              ok look          | 0 ok: package: nothing newer; ruv started (run 1)
              ok bad_look      | 2 problem: compareweb 45: Couldn't ping KRO, maybe the KRO is down; ruv not started (run 2)
              ok bad_look look | 0 ok: package: nothing newer; ruv started (run 1)
              bad look         | 2 problem: expand 31: There's no update available for this system on internet currently; ruv started (run 1)
              bad bad_look     | 2 problem: expand 31: There's no update available for this system on internet currently; ruv started (run 1)
              bad_look ok      | 0 ok: package: nothing newer; ruv started (run 2)
              look             | 0 ok: package: available; ruv not started (run 1)
              ok help          | 0 ok: package: nothing newer; ruv started (run 1)
              bad_look help    | 2 problem: compareweb 45: Couldn't ping KRO, maybe the KRO is down; ruv not started (run 1)
              ok cut           | 3 unknown: unfinished: in tavtool (run 2)
              bad cut_look     | 2 problem: expand 31: There's no update available for this system on internet currently; ruv started (run 1)
              bad cut_update   | 3 unknown: unfinished: in tavtool (run 2)
              cut ok           | 0 ok: package: nothing newer; ruv started (run 2)
              help             | 3 unknown: no run that launched or updated
              text             | 3 unknown: no run of the launcher in /var/log/ZEM_Support/ruvtav.log)")) {
    const std::string status = row[1][0] == '0' ? "" : std::string("status ") + row[1][0], line = row[1].substr(2);
    EXPECT_EQ(ReportOf(Composed(row[0], pieces), "--check"), line + "\n" + status);
    const Strings lines = Split(Report("--check --json") + "\n", '\n');
    EXPECT_EQ(json::parse(lines.at(0)).at("verdict"), line.substr(0, line.find(':')));
    EXPECT_EQ(lines.at(1), status);
  }
  EXPECT_EQ(ReportOf(Composed("ok help bad", pieces), "--problems"),
            kHeader +
                "  3 problem 1234    launch expand 31: There's no update availabl...; ruv started\n"
                "3 runs: 1 ok, 1 problem, 0 unknown, 1 none\n");
  const auto check = [&](const std::string& trace, const std::string& age, const std::string& options) {
    ReportOf(trace);
    return Report("--check " + options, "touch -d '" + age + " ago' " + kTraceFile + ";");
  };
  EXPECT_THAT(check(ok, "61 days", "--max-age=61"), StartsWith("ok: "));
  EXPECT_EQ(check(ok, "61 days", "--max-age=60"), "problem: no run for 61 days\nstatus 2");
  EXPECT_EQ(check(ok, "30 hours", "--max-age=0"), "problem: no run for 1 day\nstatus 2");
  EXPECT_THAT(check(ok, "61 days", "--json --max-age=0"), HasSubstr("\"run\":0,\"verdict\":\"problem\""));
  EXPECT_THAT(check(bad, "61 days", "--max-age=1"), StartsWith("problem: expand 31"));
}

TEST(RuvTrace, ReadsFilesInOrderAndRefusesOthers) {
  const Installation machine;
  const std::string trace = TraceOf({"-b"}), half = UpTo("TAVToolCmd", trace), rest = trace.substr(half.size());
  const std::string rotated = std::string(kTraceFile) + ".1", dated = std::string(kTraceFile) + "-20260301";
  const std::string one = "\n1 run: 1 ok, 0 problem, 0 unknown, 0 none\n", file = machine.Directory() + "/old";
  WriteFile(rotated, half + TraceOf({"-h"}));
  EXPECT_THAT(ReportOf(rest), EndsWith("\n2 runs: 1 ok, 0 problem, 0 unknown, 1 none\n"));
  WriteFile(rotated, half);
  EXPECT_THAT(ReportOf(rest), EndsWith(one));
  EXPECT_EQ(json::parse(Report("--json")).at("file"), rotated);
  EXPECT_THAT(Report(std::string("--json - ") + kTraceFile + " <" + rotated), HasSubstr("{\"file\":\"-\",\"line\":1,"));
  WriteFile(dated + ".gz", "x");
  WriteFile(dated, trace);  // the newest
  fs::last_write_time(rotated, fs::last_write_time(dated) - std::chrono::hours(999));
  EXPECT_THAT(ReportOf(""), EndsWith(one));
  EXPECT_THAT(Report("--check --max-age=1", "touch -d '3 days ago' " + dated + ";"), HasSubstr("no run for 3 days"));
  fs::remove(kTraceFile);
  EXPECT_THAT(Report("--check"), StartsWith("ok: "));
  EXPECT_THAT(Report("/etc/passwd"), EndsWith("ruv-trace: no run of the launcher in /etc/passwd\nstatus 1"));
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
  EXPECT_THAT(Report("--help"), MatchesRegex("Usage: ruv-trace (.{0,80}\n){15,20}"));
  EXPECT_EQ(Report("--help"), Report("-h"));
  EXPECT_THAT(Report("--version"), MatchesRegex("ruv-trace [0-9]+\\.[0-9]+\\.[0-9]+\n"));
  EXPECT_THAT(Report("--help >/dev/full"), EndsWith("status 1"));
  for (const char* option : {"--no-such-option", "--max-age", "--max-age=", "--max-age=-1", "--max-age=1x"}) {
    EXPECT_THAT(Report(option), EndsWith("Try ruv-trace --help.\nstatus 64"));
  }
}
