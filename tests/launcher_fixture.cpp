#include "launcher_fixture.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace fs = std::filesystem;

namespace {

constexpr unsigned kTimeLimit = 20;  // seconds

void MakeExecutable(const std::string& path) { fs::permissions(path, fs::perms::all); }

[[noreturn]] void ExecuteLauncher(const std::string& launcher, Strings arguments, const RunOptions& options,
                                  const std::string& input, const std::string& output, const std::string& directory) {
  for (const auto& [name, value] : options.environment) {
    value ? setenv(name.c_str(), value->c_str(), 1) : unsetenv(name.c_str());
  }
  const int in = open(input.c_str(), O_RDONLY);
  const int out = open(output.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
  if (in < 0 || out < 0 || chdir(directory.c_str()) != 0) _exit(125);
  dup2(in, STDIN_FILENO);
  dup2(out, STDOUT_FILENO);
  dup2(out, STDERR_FILENO);
  setpgid(0, 0);
  std::signal(SIGINT, SIG_DFL);
  alarm(kTimeLimit);
  std::string program = launcher;
  const char* wrapper = std::getenv("RUV_TEST_WRAPPER");
  if (options.argv0 || (options.prelude.empty() && wrapper == nullptr)) {
    arguments.insert(arguments.begin(), options.argv0.value_or(launcher));
  } else {
    const std::string words = wrapper == nullptr ? "" : wrapper + std::string(" ");
    arguments.insert(arguments.begin(),
                     {"sh", "-c", "set -- " + words + "\"$@\"\n" + options.prelude + "\nexec \"$@\"", "sh", launcher});
    program = "/bin/sh";
  }
  std::vector<char*> argv;
  for (std::string& argument : arguments) argv.push_back(argument.data());
  argv.push_back(nullptr);
  execv(program.c_str(), argv.data());
  _exit(126);
}

}  // namespace

void LauncherTest::SetUp() {
  ASSERT_NE(std::getenv("RUV_SANDBOX"), nullptr) << "run these tests through scripts/sandbox or ctest";
  for (const char* path : {"/var/log/ZEM_Support", "/var/log/TAV_Support", kRepository, kExpansionDirectory}) {
    fs::remove_all(path);
  }
  char name[] = "/tmp/ruv-test.XXXXXX";
  directory_ = mkdtemp(name);
  fs::create_directory(directory_ + "/cwd");
  fs::copy_file(LAUNCHER_EXE, directory_ + "/launcher");
  for (const char* program : {"ruv", "tavtool", "guihelper.sh"}) Install(program);
  WriteFile(::kSystemInformationFile, "ZEM_SYSTEM_OS=203\nZEM_SYSTEM_MT=1234\nZEM_SYSTEM_ARCH=64\n");
  WriteFile(directory_ + "/data/supportlist.xml", "<MT>1234</MT>\n");
}

void LauncherTest::TearDown() {
  if (!directory_.empty()) fs::remove_all(directory_);
}

void LauncherTest::Install(const std::string& name, const std::string& then) {
  const std::string path = directory_ + "/" + name;
  WriteFile(path, "#!/bin/sh\n{ for argument; do printf '[%s]' \"$argument\"; done; echo; } >>'" + directory_ +
                      "/calls." + name + "'\n" + then + "\n");
  MakeExecutable(path);
}

void LauncherTest::InstallTool(const std::map<std::string, int>& exit_code_of_verb, const std::string& output) {
  std::string then = output.empty() ? "" : "printf '%s' '" + output + "'\n";
  then += "case $1 in\n";
  for (const auto& [verb, exit_code] : exit_code_of_verb) {
    then += verb + ") exit " + std::to_string(exit_code) + " ;;\n";
  }
  Install("tavtool", then + "esac");
}

void LauncherTest::InstallCopyScript(const std::string& then) {
  WriteFile(std::string(kExpansionDirectory) + "/ruv/data/copy.sh",
            "#!/bin/sh\n{ for argument; do printf '[%s]' \"$argument\"; done; echo; } >>'" + directory_ +
                "/calls.copy.sh'\n" + then + "\n");
}

RunResult LauncherTest::Run(const Strings& arguments, const RunOptions& options) const {
  const std::string input = directory_ + "/stdin";
  const std::string output = directory_ + "/stdout";
  WriteFile(input, options.input);
  const pid_t child = fork();
  if (child == 0) ExecuteLauncher(directory_ + "/launcher", arguments, options, input, output, directory_ + "/cwd");
  int status = 0;
  waitpid(child, &status, 0);
  return {WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status), WithPlainDirectory(ReadFile(output))};
}

Strings LauncherTest::CallsOf(const std::string& name) const {
  std::ifstream file(directory_ + "/calls." + name);
  Strings calls;
  for (std::string line; std::getline(file, line);) calls.push_back(WithPlainDirectory(line));
  return calls;
}

std::string LauncherTest::Trace() const { return WithPlainDirectory(ReadFile(kTraceFile)); }

Strings LauncherTest::TraceLines(const std::string& prefix) const {
  const std::string wanted = "[TAVRUV]: " + prefix;
  std::istringstream file(Trace());
  Strings lines;
  for (std::string line; std::getline(file, line);) {
    if (line.compare(0, wanted.size(), wanted) == 0) lines.push_back(line.substr(wanted.size()));
  }
  return lines;
}

std::string LauncherTest::WithPlainDirectory(std::string text) const {
  for (std::size_t at = 0; (at = text.find(directory_, at)) != std::string::npos;) {
    text.replace(at, directory_.size(), "@");
  }
  return text;
}
