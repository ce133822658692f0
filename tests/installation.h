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
using testing::AllOf, testing::AnyOf, testing::ElementsAre, testing::EndsWith, testing::HasSubstr, testing::IsEmpty;
using testing::Not, testing::PrintToString, testing::SizeIs, testing::StartsWith;
using Strings = std::vector<std::string>;

inline constexpr const char* kTraceFile = "/var/log/ZEM_Support/ruvtav.log";
inline constexpr const char* kTraceDirectory = "/var/log/ZEM_Support";
inline constexpr const char* kSystemInformationFile = "/var/log/TAV_Support/guihelp.dat";
inline constexpr const char* kRepository = "/var/ZEM_Support";
inline constexpr const char* kExpansionDirectory = "/tmp/tav";

struct RunResult {
  int status = -1;  // as a shell gives it
  std::string out;  // standard output and standard error, in the order written
};

void WriteFile(const std::string& path, const std::string& text);
std::string ReadFile(const std::string& path);  // empty if there is no such file

// A prelude that sets an environment variable.
inline std::string Environment(const std::string& name, const std::string& value) {
  return "export " + name + "='" + value + "'";
}

class Installation {
 public:
  // Installs the launcher on a supported 64-bit rhel5 machine of type 1234, without a repository. Removes what an
  // earlier installation left in the launcher's fixed directories. Throws outside a sandbox.
  Installation();
  ~Installation() { fs::remove_all(directory_); }
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
  void CreateRepository() const { fs::create_directory(kRepository); }
  // A package in the repository that can be installed.
  void OfferPackage(const std::string& tool_output = "") const;
  // Leaves the machine's type out of the support list.
  void MakeUnsupported() const { WriteFile(SupportListFile(), "<MT>9999</MT>\n"); }

  // Runs the launcher in the empty directory "cwd" of the application's directory, without input, for at most 20
  // seconds. The prelude is shell text that is run just before: it may put a command that starts the launcher into
  // $with, or start "$launcher" "$@" itself.
  RunResult Run(const Strings& arguments = {}, const std::string& prelude = "") const;

  // The calls that a stand-in has received: one element per call, each argument in brackets.
  Strings CallsOf(const std::string& name) const;
  // The first argument of each call of tavtool.
  Strings ToolVerbs() const;
  // The trace file's text. Here and in every text read back, "@" is the application's directory.
  std::string Trace() const;
  // The rest of each trace line that begins with "[TAVRUV]: " and the prefix.
  Strings TraceLines(const std::string& prefix) const;
  std::string LastTraceLine(const std::string& prefix) const;  // "none" if there is none

 private:
  std::string WithPlainDirectory(const std::string& text) const;

  std::string directory_;
};

// True if a tool such as valgrind or AddressSanitizer watches the launcher: it changes the environment, needs /proc and
// far more memory than the launcher.
bool IsInstrumented();

// Returns the path of a program to be tested: of this build or, if RUV_TEST_PROGRAMS is set, in that directory.
std::string TestedProgram(const std::string& built, const std::string& installed);
