// Properties of every run, checked on generated command lines, files and programs.
//   RUV_PROPERTY_RUNS  number of runs (default 200)
//   RUV_PROPERTY_SEED  seed of the first run (default 1); each further run has the next one
#include <cctype>
#include <cstdint>
#include <cstdlib>
#include <random>
#include <regex>
#include <set>
#include <sstream>

#include "installation.h"

using std::string;

namespace {

Strings Split(const string& text) {
  std::istringstream fields(text);
  Strings parts;
  for (string part; std::getline(fields, part, '|');) parts.push_back(part);
  return parts;
}

// Alternatives. @ is replaced by one of kWords. Arguments reach a shell unescaped, so none of them may do harm there.
const Strings kWords =
    Split("K.|a-K.|K.-|100%K.%s%n|\xc3\xa9\xff.|dir/1234.xml|dir/12|dir/|1234||two words|-i|--gui|-h");
const Strings kArguments = Split(
    "@|@|@|@|@|@|-@|--Proxy-K.=@|-i|-r|-d|-html|-b|-v|-?|--help|--|--gui|--cmd|--show_stderr|--ipmi-lan|--vmware-esxi|"
    "--update_m|--update_os|--update_arch|--updat|--update_x");
const Strings kSystemInformation = Split(
    "ZEM_SYSTEM_OS=203\n|ZEM_SYSTEM_OS= 304 x\n|ZEM_SYSTEM_OS=0\n|ZEM_SYSTEM_OS=\n|zem_system_os=105\n|\n|"
    "ZEM_SYSTEM_ARCH=64\r\n|ZEM_SYSTEM_MT=1234\n|x ZEM_SYSTEM_MT=5678\n|ZEM_SYSTEM_MT=1234");
const Strings kSupportList =
    Split("<MT>1234</MT>\n|<MT>5678</MT>\r\n|  <MT>12\n|<mt>1234</mt>\n|<MT>\n|\n|<MT>1234</MT>");
const Strings kToolOutput = Split("Name=pack\n|Version=2.31a\n|Version=\n|Version=9|VersionVersion=3.00\n");
const Strings kAnswers = Split("y\n|N\n|yes\n|\n| y\n|Y|n");
// "kill -INT 0" signals the whole process group, like Ctrl-C.
const Strings kEnds = Split("exit 0|exit 0|exit 1|exit 255|kill -INT 0|kill -INT $$|kill -KILL $$");
const Strings kToolEnds = Split(
    "exit 0|exit 21|exit 32|exit 52|exit 61|exit 1|exit 2|exit 30|exit 51|exit 60|"
    "exit 77|exit 126|exit 255|kill -INT 0|kill -INT $$|kill -TERM $$");

class Generator {
 public:
  explicit Generator(std::uint64_t seed) : random_(seed) {}

  bool OneIn(std::size_t count) { return Below(count) == 0; }

  Strings Arguments() {
    Strings arguments(OneIn(80) ? 300 : Below(7));
    for (string& argument : arguments) {
      argument = std::regex_replace(InAnyCase(Pick(kArguments)), std::regex("@"), Pick(kWords));
    }
    if (OneIn(30)) arguments.push_back("--K." + string(600, '7'));
    if (OneIn(3)) arguments.insert(arguments.begin(), InAnyCase(OneIn(3) ? "--chkupd" : "--update"));
    return arguments;
  }

  string Input() { return Some(kAnswers); }

  // Replaces the installation's files and programs by others: ordinary, odd, missing, or directories.
  void Change(const Installation& machine) {
    machine.Install("guihelper.sh", Pick(kEnds));
    machine.InstallCopyScript("echo copied; " + Pick(kEnds));
    string tool = "cat \"$0.output\"\ncase $1 in\n";
    for (const string verb : {"comparelocal", "compareweb", "acquire", "copy", "expand"}) {
      const string usual = verb == "comparelocal" ? "exit 21" : "exit 0";
      tool += verb + ") " + (OneIn(3) ? Pick(kToolEnds) : usual) + " ;;\n";
    }
    machine.Install("tavtool", tool + "esac");
    machine.Install("ruv", Pick(kEnds));
    WriteFile(machine.Directory() + "/tavtool.output", Some(kToolOutput));
    WriteFile(kSystemInformationFile, Some(kSystemInformation));
    WriteFile(machine.SupportListFile(), Some(kSupportList));
    if (OneIn(2)) WriteFile(kTraceFile, "[TAVRUV]: of an earlier run\n");
    if (!OneIn(4)) machine.CreateRepository();
    if (OneIn(2)) fs::create_directories(machine.Directory() + "/media/update");
    for (string path : {"guihelper.sh", "tavtool", "ruv", "data/supportlist.xml", "data", kSystemInformationFile,
                        kRepository, kExpansionDirectory}) {
      if (path[0] != '/') path = machine.Directory() + "/" + path;
      if (!OneIn(20)) continue;
      fs::remove_all(path);
      if (OneIn(3)) fs::create_directory(path);
      if (OneIn(3)) WriteFile(path, "");
    }
  }

 private:
  std::size_t Below(std::size_t limit) { return static_cast<std::size_t>(random_() % limit); }
  string Pick(const Strings& alternatives) { return alternatives[Below(alternatives.size())]; }

  string Some(const Strings& alternatives) {
    string text;
    for (std::size_t count = Below(6); count > 0; --count) text += Pick(alternatives);
    return text;
  }

  string InAnyCase(string text) {
    if (!OneIn(3)) return text;
    for (char& letter : text) letter = static_cast<char>(OneIn(2) ? std::toupper(letter) : letter);
    return text;
  }

  std::mt19937_64 random_;
};

// The command line, divided as documented.
struct CommandLine {
  explicit CommandLine(const Strings& arguments) {
    std::set<string> own;
    for (std::size_t i = 0; i < arguments.size(); ++i) {
      string folded = arguments[i];
      for (char& c : folded) c = 'A' <= c && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
      help = help || arguments[i] == "-?" || arguments[i] == "-h";
      if (std::regex_match(folded, std::regex("--update_(m|os|arch)"))) {
        own.insert("identity");
        ++i;  // its value
      } else if (std::regex_match(folded, std::regex("--(chkupd|update|gui|cmd|show_stderr)"))) {
        own.insert(folded);
      } else {
        forwarded += " " + (folded == "--ipmi-lan" || folded == "--vmware-esxi" ? folded : arguments[i]);
      }
    }
    const std::size_t modes = own.count("--chkupd") + own.count("--update");
    update_mode = modes > 0;
    rejected = !help && (modes == 2 || (modes == 0 && own.count("identity") != 0));
  }

  string forwarded;  // what is not the launcher's own, a blank before each argument
  bool help = false;
  bool update_mode = false;
  bool rejected = false;
};

// Checks that a program received these arguments, however a shell has split them. The redirection at the end is an
// argument of the application if it is the value of an option.
void ExpectForwarded(const string& call, const CommandLine& line) {
  const string received = std::regex_replace(call, std::regex("\\[([^\\]]*)\\]"), " $1");
  EXPECT_THAT(received, AnyOf(line.forwarded, line.forwarded + " 2>/dev/null"));
}

unsigned long FromEnvironment(const char* variable, const char* otherwise) {
  const char* value = std::getenv(variable);
  return std::stoul(value == nullptr ? otherwise : value);
}

}  // namespace

TEST(Property, EveryRunStartsTheApplicationOnceIfItIsDue) {
  const unsigned long first_seed = FromEnvironment("RUV_PROPERTY_SEED", "1");
  const unsigned long runs = FromEnvironment("RUV_PROPERTY_RUNS", "200");
  for (unsigned long seed = first_seed; seed < first_seed + runs && !HasFailure(); ++seed) {
    Generator generator(seed);
    const Installation machine;
    generator.Change(machine);
    const Strings arguments = generator.Arguments();
    SCOPED_TRACE("RUV_PROPERTY_RUNS=1 RUV_PROPERTY_SEED=" + std::to_string(seed) + " repeats the run with " +
                 PrintToString(arguments));
    const string list = ReadFile(machine.SupportListFile());
    const string earlier_trace = ReadFile(kTraceFile);
    RunOptions options = Input(generator.Input());
    if (generator.OneIn(4)) options.prelude = "export ZEM_PORTABLE_EXEC_DIR=../media";
    const RunResult run = machine.Run(arguments, options);

    const CommandLine line(arguments);
    const bool interrupted = run.status == 1 && !line.rejected;
    EXPECT_EQ(run.status, line.rejected || interrupted ? 1 : 0);
    EXPECT_EQ(run.out.find("RUV application is determined by the user!\n") != string::npos, interrupted);

    const bool due = !line.update_mode && !line.help && run.status == 0 && run.out.find("Exit RUV\n") == string::npos;
    const Strings launches = machine.CallsOf("ruv");
    EXPECT_EQ(launches.size(), due && !ReadFile(machine.Directory() + "/ruv").empty() ? 1U : 0U);
    for (const string& call : launches) ExpectForwarded(call, line);
    for (const string& call : machine.CallsOf("tavtool")) {
      EXPECT_FALSE(line.help || line.rejected) << call;
      // The tool's own arguments end with this flag if the forwarded ones follow.
      const std::size_t flag = call.find("[--latest]");
      if (flag != string::npos) ExpectForwarded(call.substr(flag + 10), line);
    }

    ASSERT_THAT(ReadFile(machine.SupportListFile()), StartsWith(list));
    const string appended = ReadFile(machine.SupportListFile()).substr(list.size());
    EXPECT_THAT(appended, AnyOf("", AllOf(StartsWith("\n<MT>"), EndsWith("</MT>"))));
    EXPECT_TRUE(appended.empty() || run.out.find("Done\n") != string::npos);
    const ::testing::Matcher<string> ends = EndsWith("[TAVRUV]: [Debug:] Exiting TAVMaster::~TAVMaster()\n");
    EXPECT_THAT(ReadFile(kTraceFile),
                AllOf(StartsWith(earlier_trace), run.status == 0 && !line.help ? ends : Not(ends)));
  }
}
