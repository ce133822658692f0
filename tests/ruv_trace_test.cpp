// ruv-trace's reports, also of concurrent runs and damaged traces.
#include <nlohmann/json.hpp>
#include <regex>
#include <set>

#include "installation.h"

using nlohmann::json;
using testing::ContainsRegex;

namespace {

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

Strings Split(const std::string& text, const std::string& separator) {
  const std::regex pattern(separator);
  return {std::sregex_token_iterator(text.begin(), text.end(), pattern, -1), {}};
}

// Returns the columns of each line, which are separated by "|".
std::vector<Strings> Table(const std::string& text) {
  std::vector<Strings> rows;
  for (const std::string& line : Split(text, "\n *")) rows.push_back(Split(line, " *\\| *"));
  return rows;
}

json RunOf(const std::string& trace) { return json::parse(Split(ReportOf(trace, "--json"), "\n").back()); }

// Returns the lines of the listing with single blanks; the first one is the header, the last one has the totals.
Strings Listing(const std::string& trace) {
  return Split(std::regex_replace(ReportOf(trace), std::regex(" +"), " "), "\n");
}
std::string LastRun(const std::string& trace) {
  const Strings lines = Listing(trace);
  return lines.size() < 3 ? "" : lines.end()[-2].substr(lines.end()[-2].find(' ', 1) + 1);
}

// Runs the launcher where a package can be installed, and returns the trace. The launcher makes the repository itself
// if the portable medium is /media. The package has no copy script if it is "none".
std::string TraceOf(const Strings& arguments, std::map<std::string, int> tool_codes = {},
                    const std::string& medium = "", const std::string& script = "") {
  const Installation machine;
  if (medium != "/media") machine.CreateRepository();
  tool_codes.emplace("comparelocal", 21);
  machine.InstallTool(tool_codes, "Version=2.31\n");
  if (script != "none") machine.InstallCopyScript(script);
  if (script[0] == '#') WriteFile(std::string(kExpansionDirectory) + "/ruv/data/copy.sh", script + "\n");
  fs::create_directories(machine.Directory() + "/media/update");
  machine.Run(arguments, Environment("ZEM_PORTABLE_EXEC_DIR", medium.empty() ? "" : machine.Directory() + medium));
  return machine.Trace();
}

// Returns a trace put together from pieces, in which "%" is a blank. A piece is a line, or the trace of a run:
//   [Nx]ARGUMENT,...[:VERB=CODE][:/MEDIUM][{COPY-SCRIPT}][<TEXT|>TEXT]
// that is N runs with this exit code of tavtool, this portable medium and this copy script, up to and with the line
// that contains the text, or only what follows that line.
std::string Composed(const std::string& pieces) {
  static const std::regex kRun(
      "(?:(\\d+)x)?((-[^:<>{]*)(?::(\\w+)=(\\d+))?(?::(/\\w+))?(?:\\{(.*)\\})?)(?:([<>])(.*))?");
  static std::map<std::string, std::string> runs;
  std::string trace;
  for (std::string piece : Split(pieces, " ")) {
    std::replace(piece.begin(), piece.end(), '%', ' ');
    std::string text = piece + "\n";
    std::smatch part;
    if (std::regex_match(piece, part, kRun)) {
      std::string& run = runs[part[2]];
      const std::map<std::string, int> tool_codes = {{"''" + part.str(4), std::atoi(part.str(5).c_str())}};
      if (run.empty()) run = TraceOf(Split(part[3], ","), tool_codes, part[6], part[7]);
      const std::size_t end = part[8].matched ? run.find('\n', run.find(part[9])) + 1 : run.size();
      text = part[8] == ">" ? run.substr(end) : run.substr(0, end);
    }
    for (int i = part[1].matched ? std::stoi(part[1]) : 1; i > 0; --i) trace += text;
  }
  return trace;
}
}  // namespace

TEST(RuvTrace, FollowsTheLauncherStepByStep) {
  // Where a run is after each line: that of the first row whose text the line contains.
  const std::vector<Strings> states = Table(
      R"(Entering TAVMaster::GetTAVBinaryPath | the launcher's directory was not found, or unfinished
         TAVMaster: command =                 | unfinished: in guihelper.sh
         Entering TAVMaster::ParseParameters  | help shown
         Unknown Parameter                    | help shown
         Exiting TAVMaster::ParseParameters   | options rejected
         TAVToolCmd                           | unfinished: in tavtool
         CopyTAVToRUVFoler: command           | unfinished: in the copy script
         InvokeRUV: command                   | unfinished: in ruv or at the question before it
                                              | unfinished: between two steps)");
  std::set<std::string> seen;
  for (const char* run : {"-b,--one,--two,-d,x:/media", "-b:/none", "--update", "--update:/media", "--update:/none",
                          "--update:compareweb=40", "--chkupd", "--ipmi-lan"}) {
    const std::string trace = Composed(run);
    EXPECT_THAT(LastRun(trace), StartsWith("ok 1234 "));
    for (std::size_t begin = 0, end = 0; (end = trace.find('\n', begin) + 1) < trace.size(); begin = end) {
      const std::string before = trace.substr(0, begin), line = trace.substr(begin, end - begin);
      const std::string after = trace.substr(end), next = after.substr(0, after.find('\n') + 1);
      if (!seen.insert(line + next).second) continue;
      SCOPED_TRACE(line);
      const auto is = [&](const std::string& text) { return line.find(text) != std::string::npos; };
      std::size_t state = 0;
      while (!is(states[state][0])) ++state;
      EXPECT_EQ(RunOf(before + line).at("reason"), states[state][1]);
      // These lines are not in every run.
      if (is("mkdir") || is("special parameters") || is("Unknown Parameter")) continue;
      EXPECT_THAT(LastRun(before + after), StartsWith("unknown "));
      // While the copy script runs, any line may be its own; the last four lines are the same in all runs.
      if (begin == 0 || is("CopyTAVToRUVFoler: command") || std::count(after.begin(), after.end(), '\n') < 4) continue;
      EXPECT_THAT(LastRun(before + line + line + after), StartsWith("unknown "));
      EXPECT_THAT(LastRun(before + next + line + after.substr(next.size())), StartsWith("unknown "));
    }
  }
}

TEST(RuvTrace, GivesTheMeaningOfExitCodes) {
  // A trace, and of its last call of tavtool: the result, the meaning, and the package's state.
  for (const Strings& row : Table(
           R"(-b:copy=1:/media<Return     | problem | Invalid command parameter specified     | unknown
              -b:copy=30:/media<Return    | ok      | You already have the latest version RUV | unknown
              -b:comparelocal=0<Return    | ok      | nothing newer                           | nothing_newer
              -b:comparelocal=61<Return   | ok      | no payload                              | nothing_newer
              -b:comparelocal=126<Return  | problem | tavtool cannot be executed              | check_failed
              -b:comparelocal=128<Return  | problem | unknown exit code                       | check_failed
              -b:comparelocal=129<Return  | problem | unknown exit code, or ended by a signal | check_failed
              -b<Cmd [TAVRUV]:%[Status:]Return%Code%from%tavtool%=%-1 | problem | the shell could not be started or waited for | check_failed
              -b:expand=52<copy.sh        | ok      | no payload                              | expanded
              -b:expand=21                | problem | unexpected exit code                    | expansion_failed
              -b:expand=30                | problem | You already have the latest version RUV | expansion_failed
              -b{none}                    | ok      | success                                 | no_copy_script
              -b{#!/no/such}              | ok      | success                                 | copy_script_not_run
              --chkupd<Return             | ok      | update available                        | available
              --chkupd:compareweb=52      | problem | unexpected exit code                    | check_failed
              --update:acquire=32<Compare | ok      | success                                 | downloaded
              --update:acquire=30         | problem | You already have the latest version RUV | download_failed)")) {
    const json run = RunOf(Composed(row[0])), call = run.at("tool_calls").back();
    EXPECT_EQ(json({row[0], call.at("result"), call.at("meaning"), run.at("package")}), json(row));
  }
}

TEST(RuvTrace, ReportsWhatARunDid) {
  for (const Strings& row : Table(
           R"(-r,x:comparelocal=0            | ok 1234 launch package: nothing newer; ruv started
              -i,/d/1234.xml:comparelocal=0  | ok 1234 launch package: nothing newer; ruv started
              -v:comparelocal=0              | ok 1234 launch package: nothing newer; ruv started or declined
              -d,x%-b%y:comparelocal=0       | ok 1234 launch package: nothing newer; ruv started or declined
              -d,--show_stderr:comparelocal=0 | problem 1234 launch option -d has no value; ruv started or declined
              -b:comparelocal=127            | problem 1234 launch comparelocal 127: tavtool not found, ...; ruv started
              --vmware-esxi,h                | ok 1234 launch package: not checked; ruv started
              --chkupd:compareweb=31         | ok 1234 check package: nothing newer; ruv not started
              --update:compareweb=33         | ok 1234 check package: nothing newer; ruv not started
              --update:comparelocal=0        | ok 1234 update package: nothing newer; ruv not started
              --update:acquire=31            | problem 1234 update acquire 31: There's no update available for this s...
              --update_m,1                   | none 1234 ? options rejected
              --chkupd<Upd [TAVRUV]:%[Status:]CheckUpdate:TAVToolCmd%=%x --chkupd>Cmd | ok 1234 check package: available; ruv not started
              -v:expand=52{printf%x}         | ok 1234 launch 2.31: copy script ran; ruv started
              -v --chkupd:compareweb=30 -b   | problem 1234 launch 2.31 installed again, or a version th...; ruv started
              -v -b:comparelocal=0 -b        | ok 1234 launch 2.31: copy script ran; ruv started
              -v --update,--update_m,5678    | ok 5678 update 2.31: copy script ran; ruv not started
              -v -b{none} -b{none}           | problem 1234 launch the package has no copy script; ruv started
              -b{#!/no/such}                 | problem 1234 launch copy script not run: not found; ruv started
              -b{echo%"x%$0:%y";%echo%sh:%$0} | ok 1234 launch 2.31: copy script ran; ruv started
              -b{rm%"$0"}                    | ok 1234 launch 2.31: copy script ran; ruv started
              -b{printf%'[TAVRUV]:%[Status:]Return%Code%from%tavtool%=%9\n[TAVRUV]:%x\nno%line%feed'} | ok 1234 launch 2.31: copy script ran; ruv started)")) {
    EXPECT_EQ(LastRun(Composed(row[0])), row[1]) << row[0];
  }
  const Installation machine;
  fs::remove(kSystemInformationFile);
  machine.Run({"--ipmi-lan"});
  EXPECT_EQ(LastRun(machine.Trace()), "problem unknown launch machine unknown: no system information; ruv started");
}

TEST(RuvTrace, PrintsEveryField) {
  EXPECT_EQ(ReportOf(Composed("-b:/media"), "--long"), R"(RUN VERDICT MACHINE DID    PACKAGE AND RUV, OR WHAT IS WRONG
  1 ok      1234    launch 2.31: copy script ran; ruv started
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
  EXPECT_THAT(Report("--json"), ContainsRegex("\"reason\":null.*_version\":\"2.31\",\"ruv\":\"started\""));
  EXPECT_EQ(ReportOf(Composed("--chkupd,--update_m,5678,--update_os,sles11,--update_arch,32<Cmd"), "--json"),
            R"({"file":"/var/log/ZEM_Support/ruvtav.log","line":1,"run":1,"verdict":"unknown",)"
            R"("reason":"unfinished: in tavtool","machine_type":"5678","operating_system":"sles11",)"
            R"("architecture":"32","mode":"check","package":"unknown","package_version":null,"ruv":"unknown",)"
            R"("command":null,"command_cut":false,"tool_calls":[{"verb":"compareweb","exit_code":null,)"
            R"("result":"unknown","meaning":"no exit code","command":"\"@/tavtool\" compareweb -l \"@\" -m 5678 )"
            R"(-o sles11 -a 32 --latest 2>/dev/null 1>/dev/null 2>&1","command_cut":false}]})"
            "\n");
  EXPECT_THAT(Report("--long"), HasSubstr("\n      reason: unfinished: in tavtool\n      compareweb: no exit code\n"));
  EXPECT_THAT(ReportOf(Composed("-b>::TAV -b>Cmd"), "--long"), ContainsRegex("line 1 of.* ./.\n *reason.*line 37 of"));
  // The application's command, which the launcher may have cut, and what follows it in the trace.
  const std::string x(457, 'x'), end = " 2>/dev/null";
  for (const auto& [traced, shown] : std::vector<std::pair<std::string, std::string>>{
           {"ruv \"x\ny" + end + "z\"" + end + "\nbackground", "ruv \"x\ny" + end + "z\"" + end},
           {"ruv -b\nbackground", "ruv -b..."},  // --show_stderr
           {"ruv --proxy-address=" + x + end, "ruv --proxy-address ***..."},
           {x + "123456789012" + end, x + "123456789012" + end + "..."},
           {x + "1234567890123" + end, x + "1234567890123 2>/dev/nul..."}}) {
    const std::string command = "[TAVRUV]: [Status:]InvokeRUV: command = " + traced.substr(0, 481);
    const json run = RunOf(Composed("-b<InvokeRUV()") + command + "\n" + Composed("-b>/ruv\""));
    EXPECT_EQ(run.at("command").get<std::string>() + (run.at("command_cut") ? "..." : ""), shown);
  }
  EXPECT_THAT(Report("--long"), HasSubstr("2>/dev/nul...\n"));
}

TEST(RuvTrace, FollowsConcurrentRuns) {
  // The trace; its runs that are ok, problem, unknown and none; and what is said of the first run.
  for (const Strings& row : Table(
           R"(-b<guihelper.sh -b                           | 1 0 1 0  | unknown ? ? unfinished: in guihelper
              -b:/media<Cmd -b                             | 1 0 1 0  | unknown 1234 launch unfinished: in tavtool
              --chkupd:compareweb=42<Cmd -h --chkupd:compareweb=42>Cmd | 0 1 0 1 | problem 1234 check compareweb 42
              -b</ruv" 19x--chkupd -b>/ruv"                | 20 0 0 0 | ok 1234 launch 2.31
              -b</ruv" 20x--chkupd -b>/ruv"                | 20 0 1 0 | unknown 1234 launch unfinished: in ruv
              2x-b<Cmd -b>Cmd                              | 1 0 1 0  | unknown 1234 launch unfinished: in tavtool
              2x-b<Cmd 2x-b>Cmd                            | 0 0 2 0  | unknown ? ? mixed
              -b<Cmd -b -b>Cmd                             | 0 0 2 0  | unknown ? ? mixed
              -b<Cmd -b --chkupd<Cmd -b:comparelocal=0<Cmd --chkupd>Cmd -b:comparelocal=0>Cmd | 1 0 3 0 | unknown ? ? mixed
              -b<copy.sh --chkupd<Cmd sh:%1:%/tmp/tav/ruv/data/copy.sh:%Permission%denied --chkupd>Cmd -b>copy.sh | 1 1 0 0 | problem 1234 launch copy script not run: Perm
              -b<copy.sh --chkupd:compareweb=42 -b>copy.sh | 1 1 0 0 | ok 1234 launch 2.31
              -b</ruv" -b<copy.sh -b>/ruv" -b>copy.sh      | 1 1 0 0 | ok 1234 launch 2.31
              -b>Cmd --chkupd                              | 1 0 1 0  | unknown ? ? its beginning is missing
              -b>/ruv" [TAVRUV]:%x -b                      | 1 0 0 0  | ok 1234 launch 2.31
              -b</ruv" [TAVRUV]:%x -b>/ruv"                | 0 0 1 0  | unknown ? ? mixed
              -h<1234 sh:%1:%/tmp/tav/ruv/data/copy.sh:%Permission%denied -h>1234 | 0 0 0 1  | none 1234 ? help shown
              -b<rhel5 -b>1234 --chkupd                    | 1 0 1 0  | unknown ? ? mixed)")) {
    const Strings lines = Listing(Composed(row[0]));
    EXPECT_EQ(std::regex_replace(lines.back(), std::regex(".*: | [a-z]+,?"), ""), row[1]) << row[0];
    EXPECT_THAT(lines.at(1), StartsWith(" 1 " + row[2])) << row[0];
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
      {{"--proxy-address=h", "--Proxy-Password=x 2>secret -x"}, "--proxy-address=h --Proxy-Password ***"},
      {{"--proxy-user=me:secret"}, "--proxy-user ***"},
      {{"--proxy-address=http://me:secret@h", "-v"}, "--proxy-address ***"},
      {{"--proxy-user=me", "-x-t", "\\\"\xc3\xb6\x07\x7f\n\xfe-"},
       "--proxy-user=me -x-t \\\"\\u00f6\\u0007\\u007f\\n\\ufffd-"},
  };
  for (const auto& [arguments, shown] : rows) {
    EXPECT_THAT(ReportOf(TraceOf(arguments), "--long"), HasSubstr("/ruv\" " + shown + " 2>/dev/null\n"));
    EXPECT_THAT(Report("--long; \"$RUV_TRACE\" --json; \"$RUV_TRACE\" --check"),
                Not(AnyOf(HasSubstr("secret"), ContainsRegex("[\x01-\x09\x0b-\x1f\x7f-\xff]"))));
    EXPECT_THAT(Report("--long --show-passwords"), Not(HasSubstr("***")));
  }
  EXPECT_THAT(ReportOf(TraceOf({"--chkupd", "--proxy-password=secret"}), "--long"),
              HasSubstr(" -m 1234 -o rhel5 -a 64 --latest --proxy-password *** 2>/dev/null 1>/dev/null 2>&1\n"));
  const std::string type = "\xc3\xa4\xe2\x82\xac\x1b";
  const std::string trace = std::regex_replace(Composed("-b"), std::regex(" 1234"), " " + type);
  EXPECT_THAT(ReportOf(trace), HasSubstr("  1 ok      \\u00... launch"));
  EXPECT_EQ(RunOf(trace).at("machine_type"), type);
}

TEST(RuvTrace, JudgesTheLastRun) {
  for (const Strings& row : Table(
           R"(-b:expand=51 -b:comparelocal=0                    | 0 ok: package: nothing newer; ruv started (run 2)
              -b:comparelocal=0 --chkupd:compareweb=42          | 2 problem: compareweb 42: Unable to connect to update website; ruv not started (run 2)
              -b:comparelocal=0 --chkupd:compareweb=42 --chkupd | 0 ok: package: nothing newer; ruv started (run 1)
              -b:expand=51 --chkupd                             | 2 problem: expand 51: Error, package corrupted or not enough free space on disk; ruv started (run 1)
              -b -b --chkupd:compareweb=42                      | 2 problem: 2.31 installed again, or a version that begins with it; ruv started (run 2)
              --chkupd:compareweb=42 -b:comparelocal=0          | 0 ok: package: nothing newer; ruv started (run 2)
              --chkupd                                          | 0 ok: package: available; ruv not started (run 1)
              --chkupd:compareweb=42 -h                         | 2 problem: compareweb 42: Unable to connect to update website; ruv not started (run 1)
              -b:expand=51 --chkupd<Cmd                         | 2 problem: expand 51: Error, package corrupted or not enough free space on disk; ruv started (run 1)
              -b:expand=51 --update<acquire                     | 3 unknown: unfinished: in tavtool (run 2)
              -h                                                | 3 unknown: no run that launched or updated
              [TAVRUV]:%x                                       | 3 unknown: no run of the launcher in /var/log/ZEM_Support/ruvtav.log)")) {
    const std::string status = row[1][0] == '0' ? "" : std::string("status ") + row[1][0], line = row[1].substr(2);
    EXPECT_EQ(ReportOf(Composed(row[0]), "--check"), line + "\n" + status);
    EXPECT_THAT(Report("--check --json"),
                AllOf(HasSubstr("\"verdict\":\"" + line.substr(0, line.find(':')) + "\""), EndsWith("}\n" + status)));
  }
  EXPECT_THAT(ReportOf(Composed("-b -h -b:expand=51"), "--problems"), ContainsRegex("^RUN.*\n  3 problem .*\n3 runs"));
  const auto check = [](const std::string& options, const std::string& age) {
    return Report("--check " + options, "touch -d '" + age + " ago' " + kTraceFile + ";");
  };
  EXPECT_THAT(check("--max-age=1", "61 days"), StartsWith("problem: expand 51"));
  ReportOf(Composed("-b:comparelocal=0"));
  EXPECT_THAT(check("--max-age=61", "61 days"), StartsWith("ok: "));
  EXPECT_EQ(check("--max-age=60", "61 days"), "problem: no run for 61 days\nstatus 2");
  EXPECT_EQ(check("--max-age=0", "30 hours"), "problem: no run for 1 day\nstatus 2");
  EXPECT_THAT(check("--max-age=0 --json", "61 days"), HasSubstr("\"run\":0,\"verdict\":\"problem\""));
}

TEST(RuvTrace, ReadsFilesInOrderAndRefusesOthers) {
  const Installation machine;
  const std::string trace = Composed("-b"), one = "\n1 run: 1 ok, 0 problem, 0 unknown, 0 none\n";
  const std::string rotated = std::string(kTraceFile) + ".1", dated = std::string(kTraceFile) + "-20260301";
  WriteFile(rotated, Composed("-b<Cmd"));
  EXPECT_THAT(ReportOf(Composed("-b>Cmd")), EndsWith(one));
  EXPECT_EQ(json::parse(Report("--json")).at("file"), rotated);
  EXPECT_THAT(Report(std::string("--json - ") + kTraceFile + " <" + rotated), HasSubstr("{\"file\":\"-\",\"line\":1,"));
  WriteFile(dated + ".gz", "x");
  WriteFile(dated, trace);  // the newest
  fs::last_write_time(rotated, fs::last_write_time(dated) - std::chrono::hours(999));
  EXPECT_THAT(ReportOf(""), EndsWith(one));
  EXPECT_THAT(Report("--check --max-age=1", "touch -d '3 days ago' " + dated + ";"), HasSubstr("no run for 3 days"));
  fs::remove(kTraceFile);
  EXPECT_THAT(Report("--check"), StartsWith("ok: "));
  for (const Strings& row : {Strings{"gzip", "zcat"}, {"xz", "xzcat"}, {"bzip2", "bzcat"}, {"zstd", "zstdcat"}}) {
    if (std::system((row[0] + " <" + dated + " >" + dated + ".gz 2>/dev/null").c_str()) != 0) continue;
    EXPECT_THAT(Report("--check " + dated + " " + dated + ".gz"),
                EndsWith(".gz is compressed: in bash, write <(" + row[1] + " " + dated + ".gz) instead\nstatus 3"));
  }
  EXPECT_THAT(Report("--check /tmp/none"), "unknown: cannot read /tmp/none: No such file or directory\nstatus 3");
  EXPECT_THAT(Report("/tmp"), EndsWith("cannot read /tmp: Is a directory\nstatus 1"));
  EXPECT_EQ(Report("/etc/passwd"), "ruv-trace: no run of the launcher in /etc/passwd\nstatus 1");
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
  EXPECT_THAT(Report("--help; \"$RUV_TRACE\" -h; \"$RUV_TRACE\" --version"),
              ContainsRegex("^(Usage: ruv-trace (.{0,80}\n){15,20}){2}ruv-trace [0-9]+\\.[0-9]+\\.[0-9]+\n$"));
  for (const char* option : {"--no-such-option", "--max-age", "--max-age=", "--max-age=-1", "--max-age=1x"}) {
    EXPECT_THAT(Report(option), EndsWith("Try ruv-trace --help.\nstatus 64"));
  }
}
