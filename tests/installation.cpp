#include "installation.h"

#include <sys/wait.h>

#include <cstdlib>
#include <fstream>
#include <regex>
#include <sstream>
#include <stdexcept>

namespace {

std::string RecordingProgram(const std::string& record, const std::string& then) {
  return "#!/bin/sh\n{ for argument; do printf '[%s]' \"$argument\"; done; echo; } >>'" + record + "'\n" + then + "\n";
}

// The rest of each line that begins with the prefix.
Strings LinesOf(const std::string& text, const std::string& prefix) {
  std::istringstream file(text);
  Strings lines;
  for (std::string line; std::getline(file, line);) {
    if (line.compare(0, prefix.size(), prefix) == 0) lines.push_back(line.substr(prefix.size()));
  }
  return lines;
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

void Installation::Install(const std::string& name, const std::string& then) const {
  const std::string path = directory_ + "/" + name;
  WriteFile(path, RecordingProgram(directory_ + "/calls." + name, then));
  fs::permissions(path, fs::perms::all);
}

void Installation::InstallTool(const std::map<std::string, int>& exit_code_of_verb, const std::string& output) const {
  std::string then = "printf '%s' '" + output + "'\ncase $1 in\n";
  for (const auto& [verb, exit_code] : exit_code_of_verb) then += verb + ") exit " + std::to_string(exit_code) + ";;\n";
  Install("tavtool", then + "esac");
}

void Installation::InstallCopyScript(const std::string& then) const {
  WriteFile(std::string(kExpansionDirectory) + "/ruv/data/copy.sh",
            RecordingProgram(directory_ + "/calls.copy.sh", then));
}

void Installation::OfferPackage(const std::string& tool_output) const {
  CreateRepository();
  InstallTool({{"comparelocal", 21}}, tool_output);
  InstallCopyScript();
}

RunResult Installation::Run(const Strings& arguments, const std::string& prelude) const {
  std::string script = "cd '" + directory_ + "/cwd'; launcher='" + directory_ + "/launcher'\nset --";
  for (const std::string& argument : arguments) script += " '" + argument + "'";
  script += "\nunset ZEM_PORTABLE_EXEC_DIR\n" + prelude + "\nexec $with $RUV_TEST_WRAPPER \"$launcher\" \"$@\"\n";
  WriteFile(directory_ + "/run", script);
  const std::string command = "exec env --default-signal timeout 20 sh " + directory_ + "/run";
  const int status = std::system((command + " </dev/null >" + directory_ + "/stdout 2>&1").c_str());
  return {WEXITSTATUS(status), WithPlainDirectory(ReadFile(directory_ + "/stdout"))};
}

Strings Installation::CallsOf(const std::string& name) const {
  return LinesOf(WithPlainDirectory(ReadFile(directory_ + "/calls." + name)), "");
}

Strings Installation::ToolVerbs() const {
  Strings verbs;
  for (const std::string& call : CallsOf("tavtool")) verbs.push_back(call.substr(1, call.find(']') - 1));
  return verbs;
}

std::string Installation::Trace() const { return WithPlainDirectory(ReadFile(kTraceFile)); }

Strings Installation::TraceLines(const std::string& prefix) const { return LinesOf(Trace(), "[TAVRUV]: " + prefix); }

std::string Installation::LastTraceLine(const std::string& prefix) const {
  const Strings lines = TraceLines(prefix);
  return lines.empty() ? "none" : lines.back();
}

std::string Installation::WithPlainDirectory(const std::string& text) const {
  return std::regex_replace(text, std::regex(directory_), "@");
}
