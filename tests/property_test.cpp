// What holds for every run, whatever the command line, the files and the other programs are like.
//   RUV_PROPERTY_RUNS  how many runs (default 300)
//   RUV_PROPERTY_SEED  the first run's seed (default 1); each further run has the next one
#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <set>
#include <sstream>

#include "launcher_fixture.h"
#include "run_generator.h"

namespace fs = std::filesystem;
using std::string;
using ::testing::AllOf;
using ::testing::EndsWith;
using ::testing::Not;
using ::testing::PrintToString;
using ::testing::StartsWith;

namespace {

constexpr std::size_t kLongestTraceLine = 522;  // bytes, with the line feed

string InLowerCase(string text) {
  for (char& c : text) c = 'A' <= c && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
  return text;
}

bool IsIdentityOption(const string& folded) {
  return folded == "--update_m" || folded == "--update_os" || folded == "--update_arch";
}

bool IsOwnOption(const string& folded) {
  static const std::set<string> flags = {"--chkupd", "--update", "--gui", "--cmd", "--show_stderr"};
  return IsIdentityOption(folded) || flags.count(folded) != 0;
}

// The numbers of the markers in the text, in their order.
std::vector<unsigned long> MarkersIn(const string& text) {
  std::vector<unsigned long> markers;
  for (std::size_t at = text.find('K'); at != string::npos; at = text.find('K', at + 1)) {
    markers.push_back(std::strtoul(text.c_str() + at + 1, nullptr, 10));
  }
  return markers;
}

// The command line as its documentation divides it.
struct CommandLine {
  explicit CommandLine(const Strings& arguments) {
    bool target = false;
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
      const string folded = InLowerCase(*argument);
      help = help || *argument == "-?" || *argument == "-h";
      if (IsIdentityOption(folded)) {
        target = true;
        if (std::next(argument) != arguments.end()) consumed += *++argument;
      } else if (IsOwnOption(folded)) {
        own.insert(folded);
      } else {
        forwarded.push_back(folded == "--ipmi-lan" || folded == "--vmware-esxi" ? folded : *argument);
      }
    }
    update_mode = own.count("--chkupd") + own.count("--update") > 0;
    rejected = !help && (own.count("--chkupd") + own.count("--update") == 2 || (target && !update_mode));
  }

  // What the application gets, its arguments joined by blanks, where the shell finds nothing special in them but the
  // blanks at which it takes bare arguments apart. The redirection at the end is itself an argument where it is the
  // value of an option.
  string Received() const {
    const std::set<string> takes_value = {"-i", "-r", "-d", "-html"};
    string received;
    bool is_value = false;
    for (const string& argument : forwarded) {
      received += argument + " ";
      is_value = !is_value && takes_value.count(argument) != 0;
    }
    return is_value && own.count("--show_stderr") == 0 ? received + "2>/dev/null " : received;
  }

  std::set<string> own;
  string consumed;    // the values of the identity options, all in one
  Strings forwarded;  // as the user typed them, remote targets' options in lower case
  bool help = false;
  bool update_mode = false;
  bool rejected = false;
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
void ExpectForwarded(const Strings& arguments, const CommandLine& line) {
  const std::vector<unsigned long> consumed = MarkersIn(line.consumed);
  unsigned long last = 0;
  for (const string& argument : arguments) {
    EXPECT_FALSE(IsOwnOption(InLowerCase(argument))) << argument;
    for (const unsigned long marker : MarkersIn(argument)) {
      EXPECT_LT(last, marker) << argument;
      EXPECT_THAT(consumed, Not(::testing::Contains(marker))) << argument;
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

  RunResult Start(const GeneratedRun& run) const {
    RunOptions options = Input(run.input);
    options.environment["RUV_CALLS"] = CallsFile();
    options.environment["ZEM_PORTABLE_EXEC_DIR"];
    if (run.portable) options.environment["ZEM_PORTABLE_EXEC_DIR"] = Directory() + "/media";
    return Run(run.arguments, options);
  }

  // Returns how often the application was started.
  unsigned ExpectCalls(const GeneratedRun& run, const CommandLine& line) const {
    unsigned launches = 0;
    for (const Call& call : CallsIn(ReadFile(CallsFile()))) {
      EXPECT_TRUE(call.program == "guihelper.sh" || !(line.help || line.rejected)) << call.program;
      const auto behind_flags = std::find(call.arguments.begin(), call.arguments.end(), "--latest");
      if (call.program == "tavtool") ExpectForwarded({behind_flags, call.arguments.end()}, line);
      if (call.program != "ruv") continue;
      ++launches;
      ExpectForwarded(call.arguments, line);
      string received;
      for (const string& argument : call.arguments) received += argument + " ";
      if (run.noisy) continue;
      EXPECT_EQ(received, line.Received());
    }
    return launches;
  }

  void ExpectTrace(const GeneratedRun& run, bool to_the_end) const {
    if (!fs::is_directory("/var/log/ZEM_Support") || fs::is_directory(kTraceFile)) return;
    const string trace = ReadFile(kTraceFile);
    const auto holds_line_feed = [](const string& argument) { return argument.find('\n') != string::npos; };
    ExpectTraceLines(trace, std::any_of(run.arguments.begin(), run.arguments.end(), holds_line_feed));
    EXPECT_EQ(trace.rfind(kEarlierTrace, 0) == 0, run.files.count(kTraceFile) != 0);
    const ::testing::Matcher<string> ends = EndsWith("[TAVRUV]: [Debug:] Exiting TAVMaster::~TAVMaster()\n");
    EXPECT_THAT(trace, to_the_end ? ends : Not(ends));
  }

  void Check(const GeneratedRun& run) {
    const string list_file = Directory() + "/data/supportlist.xml";
    LayOut(run);
    const string list = ReadFile(list_file);
    const RunResult result = Start(run);

    const CommandLine line(run.arguments);
    const bool interrupted = result.status == 1 && !line.rejected;
    EXPECT_EQ(result.status, line.rejected || interrupted ? 1 : 0);
    const string interrupt = "RUV application is determined by the user!\n";
    EXPECT_EQ(result.out.find(interrupt) != string::npos, interrupted) << result.out;

    const unsigned launches = ExpectCalls(run, line);
    const bool declined = result.out.find("Exit RUV\n") != string::npos;
    const bool due = !line.update_mode && !line.help && result.status == 0 && !declined;
    EXPECT_LE(launches, due ? 1U : 0U);
    const bool startable = !run.noisy && fs::is_regular_file(Directory() + "/ruv");
    EXPECT_GE(launches, due && startable ? 1U : 0U);

    ASSERT_THAT(ReadFile(list_file), StartsWith(list));
    const string appended = ReadFile(list_file).substr(list.size());
    EXPECT_THAT(appended, ::testing::AnyOf("", AllOf(StartsWith("\n<MT>"), EndsWith("</MT>"))));
    EXPECT_TRUE(appended.empty() || result.out.find("Done\n") != string::npos);
    ExpectTrace(run, result.status == 0 && !line.help);

    tally_["update mode"] += line.update_mode && !line.help && !line.rejected ? 1 : 0;
    tally_["application started"] += launches;
    tally_["package installed"] += appended.empty() ? 0 : 1;
    tally_["options rejected"] += line.rejected ? 1 : 0;
    tally_["tool interrupted"] += interrupted ? 1 : 0;
  }

  string CallsFile() const { return Directory() + "/calls"; }

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
