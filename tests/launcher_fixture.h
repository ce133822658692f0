// An installation of the launcher in a fresh directory, with stand-ins for the programs that it runs, and one real
// process per run. Everything is read back as the user and the other programs saw it.
#ifndef RUV_TESTS_LAUNCHER_FIXTURE_H
#define RUV_TESTS_LAUNCHER_FIXTURE_H

#include "installation.h"
class LauncherTest : public ::testing::Test {
 protected:
  static constexpr const char* kTraceFile = "/var/log/ZEM_Support/ruvtav.log";
  static constexpr const char* kRepository = "/var/ZEM_Support";
  static constexpr const char* kExpansionDirectory = "/tmp/tav";
  static constexpr const char* kSystemInformationFile = "/var/log/TAV_Support/guihelp.dat";

  // Lays out the installation of a machine of type 1234 with rhel5 on 64 bits, supported, without a repository.
  void SetUp() override;
  void TearDown() override;

  // The application's directory, without a trailing slash.
  const std::string& Directory() const { return directory_; }

  // Puts a program into the application's directory that records its arguments and then runs the shell text.
  void Install(const std::string& name, const std::string& then = "exit 0");
  // Installs a tavtool that ends with these exit codes for these verbs, and with 0 for all others.
  void InstallTool(const std::map<std::string, int>& exit_code_of_verb, const std::string& output = "");
  // Puts a copy script into the expansion directory, as an expanded package brings it along.
  void InstallCopyScript(const std::string& then = "exit 0");

  // Starts the launcher in the empty directory cwd of the application's directory, in a process group of its own, and
  // waits for its end. SIGALRM ends a launcher that takes more than 20 seconds.
  RunResult Run(const Strings& arguments, const RunOptions& options = {}) const;

  // The calls that a stand-in received since the test began: its arguments, each in brackets, one call an element.
  Strings CallsOf(const std::string& name) const;
  // The trace file's text. In it and in every text read back, the application's directory reads @.
  std::string Trace() const;
  // The rest of each trace line that begins with the prefix (and "[TAVRUV]: " before it).
  Strings TraceLines(const std::string& prefix) const;

  std::string WithPlainDirectory(std::string text) const;

 private:
  std::string directory_;
};

#endif  // RUV_TESTS_LAUNCHER_FIXTURE_H
