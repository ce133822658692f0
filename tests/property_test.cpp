// Properties of every run, checked on generated command lines, files and programs.
//   RUV_PROPERTY_RUNS  number of runs (default 200)
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

// The command line, divided as documented.
struct CommandLine {
  explicit CommandLine(const Strings& arguments) {
    const std::set<string> flags = {"--chkupd", "--update", "--gui", "--cmd", "--show_stderr"};
    const std::set<string> identity_options = {"--update_m", "--update_os", "--update_arch"};
    std::set<string> own;
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
      string folded = *argument;
      for (char& c : folded) c = 'A' <= c && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
      help = help || *argument == "-?" || *argument == "-h";
      if (identity_options.count(folded) != 0) {
        own.insert("identity");
        if (std::next(argument) != arguments.end()) ++argument;
      } else if (flags.count(folded) != 0) {
        own.insert(folded);
      } else {
        forwarded += (folded == "--ipmi-lan" || folded == "--vmware-esxi" ? folded : *argument) + " ";
      }
    }
    const std::size_t modes = own.count("--chkupd") + own.count("--update");
    update_mode = modes > 0;
    rejected = !help && (modes == 2 || (modes == 0 && own.count("identity") != 0));
  }

  string forwarded;  // what is not the launcher's own, a blank after each argument
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

// Checks the recorded calls. Returns how often the application was started.
unsigned ExpectCalls(const string& record, const GeneratedRun& run, const CommandLine& line) {
  unsigned launches = 0;
  for (const Call& call : CallsIn(record)) {
    EXPECT_TRUE(call.program == "guihelper.sh" || !(line.help || line.rejected)) << call.program;
    const bool is_launch = call.program == "ruv";
    launches += is_launch ? 1 : 0;
    // The tool's own arguments end with this flag if the forwarded ones follow.
    const auto flag = std::find(call.arguments.begin(), call.arguments.end(), "--latest");
    if (run.noisy || (!is_launch && flag == call.arguments.end())) continue;
    string received;
    std::for_each(is_launch ? call.arguments.begin() : std::next(flag), call.arguments.end(),
                  [&](const string& argument) { received += argument + " "; });
    // The redirection at the end is an argument of the application if it is the value of an option.
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
  RunOptions options = Environment("RUV_CALLS", machine.Directory() + "/calls");
  if (run.portable) options.prelude += "; export ZEM_PORTABLE_EXEC_DIR=../media";
  options.input = run.input;
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
  const unsigned long runs = FromEnvironment("RUV_PROPERTY_RUNS", 200);
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
  if (runs < 200) return;
  for (const auto& [what, count] : tally) EXPECT_GE(count, runs / 100) << "too few runs with: " << what;
}
