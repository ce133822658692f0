// What holds for every run, whatever the command line, the files and the other programs are like. Each generated run
// takes place twice: as the documentation tells it (ExpectedRun), and by the launcher. In both, the same shell takes
// the commands apart and the same stand-ins record what reaches them.
//   RUV_PROPERTY_RUNS  how many runs (default 300)
//   RUV_PROPERTY_SEED  the first run's seed (default 1); each further run has the next one
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <set>
#include <sstream>

#include "launcher_fixture.h"
#include "run_generator.h"

namespace fs = std::filesystem;
using std::string;
using ::testing::PrintToString;

namespace {

constexpr std::size_t kLongestTraceLine = 522;  // bytes, with the line feed
constexpr const char* kToNull = " 1>/dev/null 2>&1";

string Quoted(const string& text) { return '"' + text + '"'; }

int Shell(const string& command) { return std::system(command.c_str()); }

string InLowerCase(string text) {
  for (char& c : text) c = 'A' <= c && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
  return text;
}

bool EndsWith(const string& text, const string& end) {
  return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

bool IsIdentityOption(const string& folded) {
  return folded == "--update_m" || folded == "--update_os" || folded == "--update_arch";
}

bool IsOwnOption(const string& folded) {
  const std::set<string> flags = {"--chkupd", "--update", "--gui", "--cmd", "--show_stderr"};
  return IsIdentityOption(folded) || flags.count(folded) != 0;
}

// The command line as its documentation divides it.
struct CommandLine {
  explicit CommandLine(const Strings& arguments) {
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
      const auto next = std::next(argument);
      const bool has_next = next != arguments.end();
      const string folded = InLowerCase(*argument);
      help = help || *argument == "-?" || *argument == "-h";
      const bool remote = folded == "--ipmi-lan" || folded == "--vmware-esxi";
      given.insert(remote ? "remote" : IsOwnOption(folded) ? folded : *argument);
      if (IsIdentityOption(folded)) {
        target = true;
        if (has_next) identity[folded] = *++argument;
      } else if (!IsOwnOption(folded)) {
        if (*argument == "-i" && has_next) identity["--update_m"] = next->substr(next->rfind('/') + 1, 4);
        const bool bare = argument->find('-') != string::npos;
        forwarded.push_back(remote ? folded : bare ? *argument : Quoted(*argument));
      }
    }
    if (!Has("--show_stderr")) forwarded.emplace_back("2>/dev/null");
  }

  bool Has(const char* word) const { return given.count(word) != 0; }
  bool InUpdateMode() const { return Has("--chkupd") || Has("--update"); }
  bool Rejected() const { return (Has("--chkupd") && Has("--update")) || (target && !InUpdateMode()); }

  std::set<string> given;
  std::map<string, string> identity;  // by the option that sets it
  Strings forwarded;                  // as the shell gets them
  bool target = false;
  bool help = false;
};

// A run as the documentation tells it, up to what the other programs and the support list see of it.
class ExpectedRun {
 public:
  ExpectedRun(const GeneratedRun& run, const string& directory)
      : directory_(directory),
        media_(run.portable ? directory + "/media" : ""),
        input_(run.input),
        line_(run.arguments) {}

  // Runs the commands; returns the launcher's exit status.
  int Status() {
    EnsureDirectory("/var/log/ZEM_Support");
    Shell(directory_ + "/guihelper.sh" + kToNull);
    if (line_.help) return 0;
    if (line_.Rejected()) return 1;
    ReadSystemInformation();
    for (const auto& [option, value] : line_.identity) {
      (option == "--update_m" ? machine_ : option == "--update_os" ? system_ : architecture_) = value;
    }
    line_.InUpdateMode() ? Update() : Launch();
    return interrupted_ ? 1 : 0;
  }

 private:
  static void EnsureDirectory(const string& path) {
    if (!fs::is_directory(path)) Shell("mkdir -p " + path + kToNull);
  }

  void ReadSystemInformation() {
    const std::map<int, string> names = {{0, "NONE"}, {2, "yev"}, {105, "windows"}, {203, "rhel5"}, {304, "vmware40"}};
    const string path = "/var/log/TAV_Support/guihelp.dat";
    if (!fs::exists(path)) system_ = machine_ = architecture_ = "unknown";
    std::istringstream file(ReadFile(path));
    for (string text; std::getline(file, text);) {
      const auto cut_behind = [&text](const string& key) {
        const std::size_t at = text.find(key);
        if (at != string::npos) text.erase(0, at + key.size());
        return at != string::npos;
      };
      int code = 0;
      if (cut_behind("ZEM_SYSTEM_OS=")) {
        if (std::istringstream(text) >> code && names.count(code) != 0) system_ = names.at(code);
      } else if (cut_behind("ZEM_SYSTEM_MT=")) {
        machine_ = text;
      } else if (cut_behind("ZEM_SYSTEM_ARCH=")) {
        architecture_ = text;
      }
    }
  }

  // Returns what the tool's end means: 0 success, 2 a package, 3 no payload, 1 failure.
  int Tool(const string& verb, const string& paths, const string& rest) {
    const string program = directory_ + "/tavtool";
    const int status = Shell((verb == "expand" ? program : Quoted(program)) + " " + verb + " -l " + paths + " -m " +
                             machine_ + " -o " + system_ + " -a " + architecture_ + rest);
    interrupted_ = WIFSIGNALED(status) && WTERMSIG(status) == SIGINT;
    const std::map<int, int> results = {{0, 0}, {32, 0}, {21, 2}, {52, 3}, {61, 3}};
    const auto result = results.find(WEXITSTATUS(status));
    return interrupted_ || result == results.end() ? 1 : result->second;
  }

  void Update() {
    string forwarded;
    for (const string& argument : line_.forwarded) forwarded += " " + argument;
    if (Tool("compareweb", Quoted(directory_), " --latest" + forwarded + kToNull) != 0 || line_.Has("--chkupd")) return;
    const string download = media_.empty() ? repository_ : media_ + "/update";
    EnsureDirectory(download);
    if (Tool("acquire", Quoted(download), " --force --latest" + forwarded + kToNull) != 0) return;
    if (media_.empty()) Install();
  }

  void Launch() {
    if (!line_.Has("remote")) {
      if (fs::is_directory(media_ + "/update")) {
        EnsureDirectory(repository_);
        Tool("copy", Quoted(media_ + "/update") + " -t " + Quoted(repository_), kToNull);
      }
      if (!interrupted_ && fs::is_directory(repository_)) Install();
    }
    if (interrupted_ || !UserAgrees()) return;
    string command = Quoted(directory_ + "/ruv");
    const std::set<string> special = {"-i", "-r", "-d", "-html"};
    bool is_value = false;
    for (const string& argument : line_.forwarded) {
      command += " " + (is_value ? Quoted(argument) : argument);
      is_value = !is_value && special.count(argument) != 0;
    }
    Shell(command);
  }

  void Install() {
    EnsureDirectory(repository_);
    const int compared = Tool("comparelocal", Quoted(repository_) + " -s " + Quoted(directory_), " 1>tav.log 2>&1");
    const string output = ReadFile("tav.log");
    const std::size_t key = output.find("Version=");
    string version = key == string::npos ? "" : output.substr(key + 8, 4);
    version.erase(std::min(version.find('\n'), version.size()));
    if (compared != 2) return;
    EnsureDirectory("/tmp/tav");
    const int expanded = Tool("expand", Quoted(repository_) + " -t " + Quoted("/tmp/tav"), kToNull);
    const string script = "/tmp/tav/ruv/data/copy.sh";
    if ((expanded != 0 && expanded != 3) || !fs::is_regular_file(script)) return;
    const string source = expanded == 3 ? "NO_TAV_PAYLOAD" : repository_;
    Shell(Quoted(script) + " " + Quoted("/tmp/tav") + " " + Quoted(directory_) + " " + Quoted(source) + " " + version +
          " 1>>/var/log/ZEM_Support/ruvtav.log 2>&1");
    std::ofstream(directory_ + "/data/supportlist.xml", std::ios::app) << "\n<MT>" << machine_ << "</MT>";
    installed_ = true;
  }

  bool UserAgrees() const {
    if (installed_ || line_.Has("-i") || line_.Has("-r") || line_.Has("remote") || line_.Has("-b")) return true;
    std::istringstream list(ReadFile(directory_ + "/data/supportlist.xml"));
    for (string text; std::getline(list, text);) {
      if (text.find("<MT>") != string::npos && text.substr(4, 4) == machine_) return true;
    }
    std::istringstream answers(input_);
    for (string answer; std::getline(answers, answer);) {
      if (InLowerCase(answer) == "y" || InLowerCase(answer) == "n") return InLowerCase(answer) == "y";
    }
    return false;
  }

  const string repository_ = "/var/ZEM_Support";
  const string directory_;
  const string media_;  // empty unless the installation is portable
  const string input_;
  const CommandLine line_;
  string system_ = "windows";
  string machine_ = "0000";
  string architecture_ = "64";
  bool installed_ = false;
  bool interrupted_ = false;
};

struct Call {
  string program;
  Strings arguments;
};

std::vector<Call> CallsIn(const string& record) {
  std::istringstream fields(record);
  const auto next = [&fields] {
    string field;
    std::getline(fields, field, '\0');
    return field;
  };
  std::vector<Call> calls;
  for (string program = next(); fields; program = next()) {
    calls.push_back({program, Strings(std::stoul(next()))});
    for (string& argument : calls.back().arguments) argument = next();
  }
  return calls;
}

// Of the arguments that reached another program: none is the launcher's own, and the markers still rise.
void ExpectForwarded(const Strings& arguments) {
  unsigned long last = 0;
  for (const string& argument : arguments) {
    EXPECT_FALSE(IsOwnOption(InLowerCase(argument))) << argument;
    for (std::size_t at = argument.find('K'); at != string::npos; at = argument.find('K', at + 1)) {
      const unsigned long marker = std::strtoul(argument.c_str() + at + 1, nullptr, 10);
      EXPECT_LT(last, marker) << argument;
      last = marker;
    }
  }
}

// A line without the prefix continues a message of several lines, or comes from the copy script and its shell.
void ExpectTraceLines(const string& trace, bool arguments_hold_line_feeds) {
  const string continuations[] = {"RUV can not acquire", "Please check", "Ensure that", "If you need"};
  const auto starts_with = [](const string& line, const string& start) { return line.rfind(start, 0) == 0; };
  std::istringstream lines(trace);
  std::size_t length = 0;  // of the message so far, with the prefix
  bool in_copy_script = false;
  for (string line; std::getline(lines, line);) {
    const bool begins = starts_with(line, "[TAVRUV]: ");
    if (in_copy_script && !begins) continue;
    in_copy_script = starts_with(line, "[TAVRUV]: [Status:]CopyTAVToRUVFoler: command = ");
    length = (begins ? 0 : length) + line.size() + 1;
    EXPECT_LE(length, kLongestTraceLine) << line;
    EXPECT_TRUE(begins || arguments_hold_line_feeds ||
                std::any_of(std::begin(continuations), std::end(continuations),
                            [&](const string& start) { return starts_with(line, start); }))
        << line;
  }
}

class Property : public LauncherTest {
 protected:
  void LayOut(const GeneratedRun& run) const {
    for (const fs::path path : {"/var/log/ZEM_Support", "/var/log/TAV_Support", kRepository, kExpansionDirectory}) {
      fs::remove_all(path);
    }
    for (const auto& entry : fs::directory_iterator(Directory())) {
      if (entry.path().filename() != "launcher") fs::remove_all(entry);
    }
    fs::create_directory(Directory() + "/cwd");
    for (const auto& [name, text] : run.files) {
      const fs::path path = fs::path(Directory()) / name;
      text ? WriteFile(path, *text) : (void)fs::create_directories(path);
      fs::permissions(path, fs::perms::all);
    }
  }

  // Returns the exit status; the run's traces are in the files.
  int RunAsExpected(const GeneratedRun& run) const {
    const pid_t child = fork();
    if (child == 0) {
      setpgid(0, 0);  // a stand-in's Ctrl-C is for this run alone
      setenv("RUV_CALLS", CallsFile().c_str(), 1);
      if (std::freopen("/dev/null", "r", stdin) == nullptr || std::freopen("/dev/null", "w", stdout) == nullptr ||
          std::freopen("/dev/null", "w", stderr) == nullptr || chdir((Directory() + "/cwd").c_str()) != 0) {
        _exit(125);
      }
      _exit(ExpectedRun(run, Directory()).Status());
    }
    int status = 0;
    waitpid(child, &status, 0);
    return WEXITSTATUS(status);
  }

  string CallsFile() const { return Directory() + "/calls"; }
  string SupportList() const { return ReadFile(Directory() + "/data/supportlist.xml"); }

  void Check(const GeneratedRun& run) {
    LayOut(run);
    const string list_before = SupportList();
    const int expected_status = RunAsExpected(run);
    const string expected_calls = ReadFile(CallsFile());
    const string expected_list = SupportList();

    LayOut(run);
    RunOptions options = Input(run.input);
    options.environment["RUV_CALLS"] = CallsFile();
    options.environment["ZEM_PORTABLE_EXEC_DIR"];
    if (run.portable) options.environment["ZEM_PORTABLE_EXEC_DIR"] = Directory() + "/media";
    const RunResult result = Run(run.arguments, options);

    EXPECT_EQ(result.status, expected_status) << result.out;
    EXPECT_EQ(ReadFile(CallsFile()), expected_calls);
    EXPECT_EQ(SupportList(), expected_list);
    EXPECT_EQ(SupportList().substr(0, list_before.size()), list_before);

    const CommandLine line(run.arguments);
    unsigned launches = 0;
    for (const Call& call : CallsIn(ReadFile(CallsFile()))) {
      if (call.program == "ruv") ++launches;
      const auto flag = std::find(call.arguments.begin(), call.arguments.end(), "--latest");
      if (call.program == "ruv") ExpectForwarded(call.arguments);
      if (call.program == "tavtool") ExpectForwarded({flag, call.arguments.end()});
    }
    EXPECT_LE(launches, line.InUpdateMode() ? 0U : 1U);

    if (fs::is_directory("/var/log/ZEM_Support") && !fs::is_directory(kTraceFile)) {
      const string trace = ReadFile(kTraceFile);
      const auto holds_line_feed = [](const string& argument) { return argument.find('\n') != string::npos; };
      ExpectTraceLines(trace, std::any_of(run.arguments.begin(), run.arguments.end(), holds_line_feed));
      EXPECT_EQ(trace.rfind(kEarlierTrace, 0) == 0, run.files.count(kTraceFile) != 0);
      const bool to_the_end = result.status == 0 && !line.help;
      EXPECT_EQ(EndsWith(trace, "Exiting TAVMaster::~TAVMaster()\n"), to_the_end) << trace;
    }
    tally_["update mode"] += line.InUpdateMode() && !line.help && !line.Rejected() ? 1 : 0;
    tally_["application started"] += launches;
    tally_["package installed"] += SupportList().size() > list_before.size() ? 1 : 0;
    tally_["options rejected"] += line.Rejected() && !line.help ? 1 : 0;
    tally_["tool interrupted"] += result.status == 1 && !line.Rejected() ? 1 : 0;
  }

  std::map<string, unsigned long> tally_;  // of the runs, by what happened in them
};

unsigned long FromEnvironment(const char* variable, unsigned long otherwise) {
  const char* value = std::getenv(variable);
  return value == nullptr ? otherwise : std::strtoul(value, nullptr, 10);
}

TEST_F(Property, HoldsForEveryRun) {
  const unsigned long runs = FromEnvironment("RUV_PROPERTY_RUNS", 300);
  const unsigned long first_seed = FromEnvironment("RUV_PROPERTY_SEED", 1);
  for (unsigned long number = 0; number < runs && !HasFailure(); ++number) {
    const string seed = std::to_string(first_seed + number);
    const GeneratedRun run = GenerateRun(first_seed + number);
    SCOPED_TRACE("run " + std::to_string(number + 1) + "; RUV_PROPERTY_SEED=" + seed +
                 " RUV_PROPERTY_RUNS=1 repeats it alone" + "\narguments: " + PrintToString(run.arguments) +
                 "\nfiles: " + PrintToString(run.files) + "\ninput: " + PrintToString(run.input) +
                 "\nportable: " + PrintToString(run.portable));
    Check(run);
  }
  std::cout << runs << " runs from seed " << first_seed << ": " << PrintToString(tally_) << "\n";
  if (runs < 300) return;
  for (const auto& [what, count] : tally_) EXPECT_GE(count, runs / 100) << "too few runs with: " << what;
}

}  // namespace
