#include "installation.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace {

constexpr unsigned kTimeLimit = 20;  // seconds

std::string RecordingProgram(const std::string& record, const std::string& then) {
  return "#!/bin/sh\n{ for argument; do printf '[%s]' \"$argument\"; done; echo; } >>'" + record + "'\n" + then + "\n";
}

int OpenTerminal() {
  const int terminal = posix_openpt(O_RDWR | O_CLOEXEC | O_NOCTTY);
  grantpt(terminal);
  unlockpt(terminal);
  return terminal;
}

void TypeAfterTheQuestion(int terminal, const std::string& text, const std::string& output) {
  for (int wait = 0; wait < 1000 && ReadFile(output).find("(Y/N)") == std::string::npos; ++wait) usleep(10'000);
  EXPECT_EQ(write(terminal, text.data(), text.size()), static_cast<ssize_t>(text.size()));
}

// Becomes a shell that becomes the launcher.
[[noreturn]] void ExecuteLauncher(const std::string& directory, const Strings& arguments, const RunOptions& options,
                                  const std::string& input) {
  const int in = open(input.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY | (options.terminal ? O_NONBLOCK : 0));
  const int out = open((directory + "/stdout").c_str(), O_WRONLY | O_CLOEXEC);
  if (in < 0 || out < 0 || chdir((directory + "/cwd").c_str()) != 0) _exit(125);
  dup2(in, STDIN_FILENO);
  dup2(out, STDOUT_FILENO);
  dup2(out, STDERR_FILENO);
  setpgid(0, 0);
  for (const int signal : {SIGINT, SIGPIPE, SIGXFSZ, SIGCHLD}) std::signal(signal, SIG_DFL);
  alarm(kTimeLimit);
  Strings words = {"sh", "-c",
                   "unset ZEM_PORTABLE_EXEC_DIR\n" + options.prelude + "\nexec $with $RUV_TEST_WRAPPER \"$0\" \"$@\"",
                   directory + "/launcher"};
  words.insert(words.end(), arguments.begin(), arguments.end());
  std::vector<char*> argv;
  for (std::string& word : words) argv.push_back(word.data());
  argv.push_back(nullptr);
  execv("/bin/sh", argv.data());
  _exit(126);
}

}  // namespace

bool IsInstrumented() { return *RUV_SANITIZE != '\0' || std::getenv("RUV_TEST_WRAPPER") != nullptr; }

std::string TestedProgram(const std::string& built, const std::string& installed) {
  const char* directory = std::getenv("RUV_TEST_PROGRAMS");
  return directory == nullptr ? built : directory + ("/" + installed);
}

void WriteFile(const std::string& path, const std::string& text) {
  fs::create_directories(fs::path(path).parent_path());
  std::ofstream(path, std::ios::binary) << text;
}

std::string ReadFile(const std::string& path) {
  std::ostringstream text;
  text << std::ifstream(path, std::ios::binary).rdbuf();
  return text.str();
}

Installation::Installation() {
  if (std::getenv("RUV_SANDBOX") == nullptr) throw std::runtime_error("run the tests through ctest or scripts/sandbox");
  for (const char* path : {kTraceDirectory, "/var/log/TAV_Support", kRepository, kExpansionDirectory})
    fs::remove_all(path);
  char name[] = "/tmp/ruv-test.XXXXXX";
  directory_ = mkdtemp(name);
  fs::create_directory(directory_ + "/cwd");
  fs::copy_file(TestedProgram(LAUNCHER_EXE, "launcher"), directory_ + "/launcher");
  for (const char* program : {"ruv", "tavtool", "guihelper.sh"}) Install(program);
  WriteFile(kSystemInformationFile, "ZEM_SYSTEM_OS=203\nZEM_SYSTEM_MT=1234\nZEM_SYSTEM_ARCH=64\n");
  WriteFile(SupportListFile(), "<MT>1234</MT>\n");
}

Installation::~Installation() {
  std::error_code ignored;
  fs::remove_all(directory_, ignored);
}

void Installation::Install(const std::string& name, const std::string& then) const {
  const std::string path = directory_ + "/" + name;
  WriteFile(path, RecordingProgram(directory_ + "/calls." + name, then));
  fs::permissions(path, fs::perms::all);
}

void Installation::InstallTool(const std::map<std::string, int>& exit_code_of_verb, const std::string& output) const {
  std::string then = output.empty() ? "" : "printf '%s' '" + output + "'\n";
  then += "case $1 in\n";
  for (const auto& [verb, exit_code] : exit_code_of_verb) {
    then += verb + ") exit " + std::to_string(exit_code) + " ;;\n";
  }
  Install("tavtool", then + "esac");
}

void Installation::InstallCopyScript(const std::string& then) const {
  WriteFile(std::string(kExpansionDirectory) + "/ruv/data/copy.sh",
            RecordingProgram(directory_ + "/calls.copy.sh", then));
}

void Installation::CreateRepository() const { fs::create_directory(kRepository); }

void Installation::OfferPackage(int comparison) const {
  CreateRepository();
  InstallTool({{"comparelocal", comparison}});
  InstallCopyScript();
}

void Installation::MakeUnsupported() const { WriteFile(SupportListFile(), "<MT>9999</MT>\n"); }

RunResult Installation::Run(const Strings& arguments, const RunOptions& options) const {
  const std::string output = directory_ + "/stdout";
  std::string input = directory_ + "/stdin";
  WriteFile(output, "");
  WriteFile(input, options.input);
  const int terminal = options.terminal ? OpenTerminal() : -1;
  if (options.terminal) input = ptsname(terminal);
  const pid_t child = fork();
  if (child == 0) ExecuteLauncher(directory_, arguments, options, input);
  if (options.terminal) TypeAfterTheQuestion(terminal, options.input, output);
  int status = 0;
  waitpid(child, &status, 0);
  if (options.terminal) close(terminal);
  return {WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status), WithPlainDirectory(ReadFile(output))};
}

Strings Installation::CallsOf(const std::string& name) const {
  std::ifstream file(directory_ + "/calls." + name);
  Strings calls;
  for (std::string line; std::getline(file, line);) calls.push_back(WithPlainDirectory(line));
  return calls;
}

Strings Installation::ToolVerbs() const {
  Strings verbs;
  for (const std::string& call : CallsOf("tavtool")) verbs.push_back(call.substr(1, call.find(']') - 1));
  return verbs;
}

std::string Installation::Trace() const { return WithPlainDirectory(ReadFile(kTraceFile)); }

Strings Installation::TraceLines(const std::string& prefix) const {
  const std::string wanted = "[TAVRUV]: " + prefix;
  std::istringstream file(Trace());
  Strings lines;
  for (std::string line; std::getline(file, line);) {
    if (line.compare(0, wanted.size(), wanted) == 0) lines.push_back(line.substr(wanted.size()));
  }
  return lines;
}

std::string Installation::WithPlainDirectory(std::string text) const {
  for (std::size_t at = 0; (at = text.find(directory_, at)) != std::string::npos;) {
    text.replace(at, directory_.size(), "@");
  }
  return text;
}
