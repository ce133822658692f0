// Properties of every run, checked on generated command lines, files and programs.
//   RUV_PROPERTY_RUNS  number of runs (default 300)
//   RUV_PROPERTY_SEED  seed of the first run (default 1); each further run has the next one
#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <set>
#include <sstream>

#include "installation.h"
#include "run_generator.h"

namespace fs = std::filesystem;
using std::string;
using ::testing::AllOf;
using ::testing::EndsWith;
using ::testing::Not;
using ::testing::PrintToString;
using ::testing::StartsWith;

namespace {

string InLowerCase(string text) {
  for (char& c : text) c = 'A' <= c && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
  return text;
}

// Options with a value that the launcher takes as well, and options without.
const std::set<string> kIdentityOptions = {"--update_m", "--update_os", "--update_arch"};
const std::set<string> kFlags = {"--chkupd", "--update", "--gui", "--cmd", "--show_stderr"};

// The numbers of the markers in the text, in their order.
std::vector<unsigned long> MarkersIn(const string& text) {
  std::vector<unsigned long> markers;
  for (std::size_t at = text.find('K'); at != string::npos; at = text.find('K', at + 1)) {
    markers.push_back(std::strtoul(text.c_str() + at + 1, nullptr, 10));
  }
  return markers;
}

// The command line, divided as documented.
struct CommandLine {
  explicit CommandLine(const Strings& arguments) {
    bool target = false;
    std::set<string> own;
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
      const string folded = InLowerCase(*argument);
      help = help || *argument == "-?" || *argument == "-h";
      if (kIdentityOptions.count(folded) != 0) {
        target = true;
        if (std::next(argument) != arguments.end()) consumed += *++argument;
      } else if (kFlags.count(folded) != 0) {
        own.insert(folded);
      } else {
        forwarded += (folded == "--ipmi-lan" || folded == "--vmware-esxi" ? folded : *argument) + " ";
      }
    }
    update_mode = own.count("--chkupd") + own.count("--update") > 0;
    rejected = !help && (own.count("--chkupd") + own.count("--update") == 2 || (target && !update_mode));
  }

  string consumed;   // the values of the identity options
  string forwarded;  // all other arguments, a blank after each
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

// Expects that no argument passed to another program is the launcher's own, and that they are in the user's order.
void ExpectForwarded(const Strings& arguments, const CommandLine& line) {
  const std::vector<unsigned long> consumed = MarkersIn(line.consumed);
  unsigned long last = 0;
  for (const string& argument : arguments) {
    const string folded = InLowerCase(argument);
    EXPECT_EQ(kIdentityOptions.count(folded) + kFlags.count(folded), 0U) << argument;
    for (const unsigned long marker : MarkersIn(argument)) {
      EXPECT_LT(last, marker) << argument;
      EXPECT_THAT(consumed, Not(::testing::Contains(marker))) << argument;
      last = marker;
    }
  }
}

// Returns how often the application was started.
unsigned ExpectCalls(const string& record, const GeneratedRun& run, const CommandLine& line) {
  unsigned launches = 0;
  for (const Call& call : CallsIn(record)) {
    EXPECT_TRUE(call.program == "guihelper.sh" || !(line.help || line.rejected)) << call.program;
    const auto after_flags = std::find(call.arguments.begin(), call.arguments.end(), "--latest");
    if (call.program == "tavtool") ExpectForwarded({after_flags, call.arguments.end()}, line);
    if (call.program != "ruv") continue;
    ++launches;
    ExpectForwarded(call.arguments, line);
    string received;
    for (const string& argument : call.arguments) received += argument + " ";
    if (run.noisy) continue;
    // The redirection at the end is an argument if it is the value of an option.
    EXPECT_THAT(received, ::testing::AnyOf(line.forwarded, line.forwarded + "2>/dev/null "));
  }
  return launches;
}

void LayOut(const GeneratedRun& run, const Installation& machine) {
  for (const auto& entry : fs::directory_iterator(machine.Directory())) {
    if (entry.path().filename() != "launcher") fs::remove_all(entry);
  }
  fs::remove_all(kSystemInformationFile);
  fs::create_directory(machine.Directory() + "/cwd");
  for (const auto& [name, text] : run.files) {
    const fs::path path = fs::path(machine.Directory()) / name;
    text ? WriteFile(path, *text) : (void)fs::create_directories(path);
    fs::permissions(path, fs::perms::all);
  }
}

// Runs the launcher and checks what it did. Counts in the tally what happened.
void Check(const GeneratedRun& run, std::map<string, unsigned long>& tally) {
  const Installation machine;
  LayOut(run, machine);
  const string list = ReadFile(machine.SupportListFile());
  RunOptions options = Input(run.input);
  options.environment["RUV_CALLS"] = machine.Directory() + "/calls";
  options.environment["ZEM_PORTABLE_EXEC_DIR"];
  if (run.portable) options.environment["ZEM_PORTABLE_EXEC_DIR"] = machine.Directory() + "/media";
  const RunResult result = machine.Run(run.arguments, options);

  const CommandLine line(run.arguments);
  const bool interrupted = result.status == 1 && !line.rejected;
  EXPECT_EQ(result.status, line.rejected || interrupted ? 1 : 0);
  EXPECT_EQ(result.out.find("RUV application is determined by the user!\n") != string::npos, interrupted);

  const unsigned launches = ExpectCalls(ReadFile(machine.Directory() + "/calls"), run, line);
  const bool declined = result.out.find("Exit RUV\n") != string::npos;
  const bool due = !line.update_mode && !line.help && result.status == 0 && !declined;
  const bool startable = !run.noisy && fs::is_regular_file(machine.Directory() + "/ruv");
  EXPECT_LE(launches, due ? 1U : 0U);
  EXPECT_GE(launches, due && startable ? 1U : 0U);

  ASSERT_THAT(ReadFile(machine.SupportListFile()), StartsWith(list));
  const string appended = ReadFile(machine.SupportListFile()).substr(list.size());
  EXPECT_THAT(appended, ::testing::AnyOf("", AllOf(StartsWith("\n<MT>"), EndsWith("</MT>"))));
  EXPECT_TRUE(appended.empty() || result.out.find("Done\n") != string::npos);

  if (fs::is_regular_file(kTraceFile)) {
    const string trace = ReadFile(kTraceFile);
    EXPECT_THAT(trace, StartsWith(run.files.count(kTraceFile) != 0 ? kEarlierTrace : "[TAVRUV]: [Debug:] Enter"));
    const ::testing::Matcher<string> ends = EndsWith("[TAVRUV]: [Debug:] Exiting TAVMaster::~TAVMaster()\n");
    EXPECT_THAT(trace, result.status == 0 && !line.help ? ends : Not(ends));
  }

  tally["update mode"] += line.update_mode && !line.help && !line.rejected ? 1 : 0;
  tally["application started"] += launches;
  tally["package installed"] += appended.empty() ? 0 : 1;
  tally["options rejected"] += line.rejected ? 1 : 0;
  tally["tool interrupted"] += interrupted ? 1 : 0;
}

unsigned long FromEnvironment(const char* variable, unsigned long otherwise) {
  const char* value = std::getenv(variable);
  return value == nullptr ? otherwise : std::strtoul(value, nullptr, 10);
}

}  // namespace

TEST(Property, HoldsForEveryRun) {
  const unsigned long runs = FromEnvironment("RUV_PROPERTY_RUNS", 300);
  const unsigned long first_seed = FromEnvironment("RUV_PROPERTY_SEED", 1);
  std::map<string, unsigned long> tally;
  for (unsigned long number = 0; number < runs && !HasFailure(); ++number) {
    const string seed = std::to_string(first_seed + number);
    const GeneratedRun run = GenerateRun(first_seed + number);
    SCOPED_TRACE("run " + std::to_string(number + 1) + "; RUV_PROPERTY_SEED=" + seed +
                 " RUV_PROPERTY_RUNS=1 repeats it alone" + "\narguments: " + PrintToString(run.arguments) +
                 "\nfiles: " + PrintToString(run.files) + "\ninput: " + PrintToString(run.input) +
                 "\nportable: " + PrintToString(run.portable));
    Check(run, tally);
  }
  std::cout << runs << " runs from seed " << first_seed << ": " << PrintToString(tally) << "\n";
  if (runs < 300) return;
  for (const auto& [what, count] : tally) EXPECT_GE(count, runs / 100) << "too few runs with: " << what;
}
