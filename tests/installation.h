// The launcher, installed in a fresh directory with stand-ins for the programs that it runs. Each run is a real
// process; what it did is read back as the user and the other programs saw it.
#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <string>
#include <vector>

namespace fs = std::filesystem;
using ::testing::AllOf;
using ::testing::AnyOf;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::PrintToString;
using ::testing::SizeIs;
using ::testing::StartsWith;
using Strings = std::vector<std::string>;

inline constexpr const char* kTraceFile = "/var/log/ZEM_Support/ruvtav.log";
inline constexpr const char* kTraceDirectory = "/var/log/ZEM_Support";
inline constexpr const char* kSystemInformationFile = "/var/log/TAV_Support/guihelp.dat";
inline constexpr const char* kRepository = "/var/ZEM_Support";
inline constexpr const char* kExpansionDirectory = "/tmp/tav";

struct RunOptions {
  std::string input;      // standard input, to its end
  std::string prelude;    // shell text run just before the launcher; may put a command that starts it into $with
  bool terminal = false;  // standard input is a non-blocking terminal; the input is typed after the question
};
inline RunOptions Input(const std::string& text) { return {text, "", false}; }
inline RunOptions Typed(const std::string& text) { return {text, "", true}; }
inline RunOptions Prelude(const std::string& shell_text) { return {"", shell_text, false}; }
inline RunOptions With(const std::string& command) { return Prelude("with='" + command + "'"); }
inline RunOptions Environment(const std::string& name, const std::string& value) {
  return Prelude("export " + name + "='" + value + "'");
}
// Starts the launcher under another name than its full path.
inline RunOptions StartedAs(const std::string& name) {
  return Prelude("exec bash -c 'exec -a \"$0\" \"$@\"' '" + name + "' \"$0\" \"$@\"");
}

struct RunResult {
  int status = -1;  // exit status; 1000 + N if signal N ended the launcher
  std::string out;  // standard output and standard error, in the order written
};

class Installation {
 public:
  // Installs the launcher on a supported 64-bit rhel5 machine of type 1234, without a repository. Removes what an
  // earlier installation left in the launcher's fixed directories. Throws outside a sandbox.
  Installation();
  ~Installation();
  Installation(const Installation&) = delete;
  Installation& operator=(const Installation&) = delete;

  // The application's directory, without a trailing slash.
  const std::string& Directory() const { return directory_; }
  std::string SupportListFile() const { return directory_ + "/data/supportlist.xml"; }

  // Installs a program that records its arguments and then runs the shell text.
  void Install(const std::string& name, const std::string& then = "exit 0") const;
  // Installs a tavtool that prints the output and ends with these exit codes for these verbs, with 0 for all others.
  void InstallTool(const std::map<std::string, int>& exit_code_of_verb, const std::string& output = "") const;
  // Puts a copy script into the expansion directory, where expanding a package would put it.
  void InstallCopyScript(const std::string& then = "exit 0") const;
  void CreateRepository() const;
  // A package in the repository, which can be installed or, with another exit code of the comparison, cannot.
  void OfferPackage(int comparison = 21) const;
  // Leaves the machine's type out of the support list.
  void MakeUnsupported() const;

  // Runs the launcher in the empty directory "cwd" of the application's directory, in a process group of its own, and
  // waits for it. After 20 seconds SIGALRM ends it.
  RunResult Run(const Strings& arguments = {}, const RunOptions& options = {}) const;

  // The calls that a stand-in has received: one element per call, each argument in brackets.
  Strings CallsOf(const std::string& name) const;
  // The first argument of each call of tavtool.
  Strings ToolVerbs() const;
  // The trace file's text. Here and in every text read back, "@" is the application's directory.
  std::string Trace() const;
  // The rest of each trace line that begins with "[TAVRUV]: " and the prefix.
  Strings TraceLines(const std::string& prefix) const;

  std::string WithPlainDirectory(std::string text) const;

 private:
  std::string directory_;
};

// True if a tool such as valgrind or AddressSanitizer watches the launcher: it changes the environment, needs /proc and
// far more memory than the launcher.
bool IsInstrumented();

// Returns the path of a program to be tested: of this build or, if RUV_TEST_PROGRAMS is set, in that directory.
std::string TestedProgram(const std::string& built, const std::string& installed);

void WriteFile(const std::string& path, const std::string& text);
std::string ReadFile(const std::string& path);  // empty if there is no such file
