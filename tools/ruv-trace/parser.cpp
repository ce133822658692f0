// Parser follows the launcher step by step: its members have the names and the order of the launcher's members that
// write the messages (src/launcher/tav.h). A change of a message there is a change of one member here.
#include <algorithm>
#include <charconv>
#include <regex>

#include "launcher/command_fragments.h"
#include "log/trace_format.h"
#include "packages/exit_code_tables.h"
#include "run.h"

namespace ruv_trace {
namespace {
using namespace NZEMRUVTAV;

constexpr const char* kBetweenSteps = "unfinished: between two steps";

struct Stopped {};  // the message that the launcher writes next is not there

struct Parser {
  const std::string *next_, *end_;
  Run& run_;
  std::vector<std::string>& expected_;

  // Reads the run up to its end or to where it stopped.
  bool Read() {
    expected_.clear();
    try {
      TAVMaster();
      const bool is_known = run_.system != "unknown";
      TAVMasterMain();
      Enter("~TAVMaster");
      Exit("~TAVMaster");
      if (!is_known) Fail("machine unknown: no system information");
      if (run_.package == "unknown") run_.package = "not_checked";
      if (run_.mode != "launch") run_.ruv = "not_started";
      run_.stopped = "";
    } catch (const Stopped&) {
    }
    return next_ == end_;
  }

  // Takes the next message if it is this one, and returns its value. Until the next one the run is between two steps.
  std::optional<std::string> Take(const std::string& text) {
    if (next_ == end_) expected_.push_back(text);
    if (next_ == end_ || !Matches(*next_, text)) return {};
    run_.stopped = kBetweenSteps;
    const std::string value = next_++->substr(text.size());
    return value.substr(0, value.find('\n'));
  }

  // The same, but the run stops if the message is not there. Until the next one the run is in this state.
  std::string Expect(const std::string& text, const char* state = kBetweenSteps) {
    const std::optional<std::string> value = Take(text);
    run_.stopped = value ? state : run_.stopped;
    return value ? *value : throw Stopped();
  }

  // Takes a command that ends with this redirection: an argument may contain line feeds. If it has none (because of
  // --show_stderr, or the launcher cut the message), the lines after the first may be other output.
  Command ExpectCommand(const std::string& text, const char* state, const std::string& redirection) {
    Expect(text, state);
    const std::string command = next_[-1].substr(text.size());
    const std::size_t longest = kMessageBufferSize - 1 - text.size();
    const std::size_t last = (command + "\n").find(redirection + "\n");
    if (last < longest - redirection.size()) return {command.substr(0, last + redirection.size())};
    const std::size_t length = std::min({command.size(), command.find('\n'), longest});
    return {command.substr(0, length), length == longest || length < command.size()};
  }
  bool TakeEntry(const std::string& member) {
    return Take("[Debug:] Entering TAVMaster::" + member + "()").has_value();
  }
  void Enter(const std::string& member, const char* state = kBetweenSteps) {
    Expect("[Debug:] Entering TAVMaster::" + member + "()", state);
  }
  void Exit(const std::string& member, const char* state = kBetweenSteps) {
    Expect("[Debug:] Exiting TAVMaster::" + member + "()", state);
  }
  void Fail(const std::string& problem) {
    if (run_.problem.empty()) run_.problem = problem;
  }

  // The steps, in the launcher's order.
  void TAVMaster() {
    Expect(kFirstMessage);
    Enter("GetTAVBinaryPath", "the launcher's directory was not found, or unfinished");
    Exit("GetTAVBinaryPath");
    Expect("[Status:]TAVMaster: command = ", "unfinished: in guihelper.sh");
    while (Take("[Debug:] Entering TAVMaster::OSMapping(), code = ")) Exit("OSMapping");
    Enter("TAVMasterGetSupportList");
    Exit("TAVMasterGetSupportList");
    run_.system = Expect("[Status:]OS = ");
    run_.machine_type = Expect("[Status:]MT = ");
    run_.architecture = Expect("[Status:]ARCH = ");
    Expect("[Status:]Working Path = ");
    Expect("[Status:]Repository Path = ");
    Expect("[Status:]TAV Uncompressed Path = ");
    Exit("TAVMaster");
  }
  bool isPortableRUV() {
    if (Take("[Status:]This is not portable version of RUV")) return false;
    Expect("[Status:]This is a portable RUV,portablePath = ");
    return true;
  }
  void TAVMasterMain() {
    Enter("TAVMasterMain");
    ParseParameters();
    TakeEntry("CheckUpdate") ? RunUpdateMode() : RunLaunchMode();
    Exit("TAVMasterMain");
  }
  void RunUpdateMode() {
    run_.mode = "check";
    CheckUpdate();
    if (run_.package != "available" || !TakeEntry("AcquireUpdate")) return;
    run_.mode = "update";
    AcquireUpdate();
    if (run_.package != "downloaded" || isPortableRUV()) return;
    Enter("CompareTAVPackage");
    CompareTAVPackage();
  }
  void RunLaunchMode() {
    const bool ignores_packages = TakeEntry("InvokeRUV");
    const bool is_portable = !ignores_packages && isPortableRUV();
    run_.mode = "launch";
    if (is_portable) CopyPortableTAVToRepository();
    if (!ignores_packages) {
      if (TakeEntry("CompareTAVPackage")) CompareTAVPackage();  // if there is a repository
      Enter("InvokeRUV");
    }
    // An installation makes the machine a supported one.
    InvokeRUV(!ignores_packages && run_.copy_command.empty());
  }
  void ParseParameters() {
    Enter("ParseParameters", kHelpShown);
    while (Take("[Status:]Warning: Unknown Parameter \"")) run_.stopped = kHelpShown;
    Exit("ParseParameters", kOptionsRejected);
  }
  // Every command of the package tool is followed by its exit code and, for some codes, their message.
  void HandleTAVToolReturnValue(const std::string& command, const std::string& verb) {
    run_.calls.push_back({verb, ExpectCommand(command, "unfinished: in tavtool", " 2>&1")});
    ReadIdentity(run_.calls.back().command);
    const std::string digits = Expect("[Status:]Return Code from tavtool = ");
    int code = 0;
    if (*std::from_chars(digits.c_str(), digits.c_str() + digits.size(), code).ptr != '\0') throw Stopped();
    ToolCall& call = run_.calls.back();
    const std::string package = TakeExitCode(call, code);
    if (!package.empty()) run_.package = package;
    if (call.result == "problem") Fail(verb + " " + digits + ": " + call.meaning);
    const std::string message = MessageOf(code);
    if (!message.empty()) Expect(message.substr(0, message.find('\n')));
  }
  // PROGRAM VERB -l "PATH" [-s|-t "PATH"] -m TYPE -o SYSTEM -a ARCHITECTURE ...
  void ReadIdentity(Command& command) {
    const std::string& text = command.text;
    const std::size_t type = command.arguments = text.find("\" -m "), system = text.find(" -o ", type);
    const std::size_t architecture = text.find(" -a ", system), end = text.find(' ', architecture + 4);
    if (architecture == std::string::npos || end == std::string::npos) return;
    run_.machine_type = text.substr(type + 5, system - type - 5);
    run_.system = text.substr(system + 4, architecture - system - 4);
    run_.architecture = text.substr(architecture + 4, end - architecture - 4);
  }
  void CheckUpdate() {
    HandleTAVToolReturnValue("[Status:]CheckUpdate:TAVToolCmd = ", TAVTOOL_CMD_COMPWEB);
    Exit("CheckUpdate");
  }
  void AcquireUpdate() {
    isPortableRUV();
    Take("[Status:]AcquireUpdate: command = ");
    HandleTAVToolReturnValue("[Status:]AcquireUpdate: TAVToolCmd = ", TAVTOOL_CMD_ACQUIRE);
    Exit("AcquireUpdate");
  }
  // Reads also the installation that follows if there is a package to install.
  void CompareTAVPackage() {
    HandleTAVToolReturnValue("[Status:]CompareTAVPackage: TAVToolCmd = ", TAVTOOL_CMD_COMPLOC);
    Exit("CompareTAVPackage");
    if (run_.package == "available") DecompressTAV();
  }
  void DecompressTAV() {
    Enter("DecompressTAV");
    HandleTAVToolReturnValue("[Status:]DecompressTAV: TAVToolCmd = ", TAVTOOL_CMD_EXPAND);
    if (run_.package == "expanded") CopyTAVToRUVFoler();
    Exit("DecompressTAV");
  }
  void CopyTAVToRUVFoler() {
    Enter("CopyTAVToRUVFoler");
    if (Take("[Status:]CopyTAVToRUVFoler: script file \"")) {
      run_.package = "no_copy_script";
      Fail("the package has no copy script");
      Exit("CopyTAVToRUVFoler");
      Expect("[Status:]DecompressTAV: Failed to copy TAV to RUV Folder!");
      return;
    }
    run_.copy_command = Expect(kCopyScriptMessage, "unfinished: in the copy script").substr(0, kMessageBufferSize);
    // The shell's own complaint, "sh: ...SCRIPT: REASON", shows that it could not run the script.
    static const std::regex kComplaint("\nsh: .*?/" + COPYSCRIPT + ": (.*)");
    std::smatch match;
    const bool ran = !std::regex_search(next_[-1], match, kComplaint);
    Exit("CopyTAVToRUVFoler");
    run_.package = ran ? "copy_script_ran" : "copy_script_not_run";
    if (!ran) Fail("copy script not run: " + match.str(1));
    // ... "SOURCE" VERSION 1>>TRACE 2>&1
    static const std::regex kVersion(R"(" ([^"]*) 1>>)");
    if (std::regex_search(run_.copy_command, match, kVersion)) run_.package_version = match.str(1);
    Expect("[Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!");
  }
  void CopyPortableTAVToRepository() {
    Enter("CopyPortableTAVToRepository");
    if (!Take("[Status:]CopyPortableTAVToRepository: The directory <Portable>/update does not Exist!")) {
      Take("[Status:]CopyPortableTAVToRepository: command = ");
      HandleTAVToolReturnValue("[Status:]CopyPortableTAVToRepository: TAVToolCmd = ", TAVTOOL_CMD_COPY);
    }
    Exit("CopyPortableTAVToRepository");
  }
  void InvokeRUV(bool may_ask) {
    while (Take("[Debug:] Processing special parameters [")) {
      const auto option = Take("[Error:]InvokeRUV: required parameters are missing for option = ");
      if (option) Fail("option " + *option + " has no value");
    }
    run_.command = ExpectCommand("[Status:]InvokeRUV: command = ", "unfinished: in ruv or at the question before it",
                                 " 2>/dev/null");
    Exit("InvokeRUV");
    // -b, -i and -r suppress the question, outside quotes. In an argument of several words they look the same.
    static const std::regex kQuoted(R"("[^"]*"?)"), kOption(" -[bir] ");
    const std::string command = run_.command.text + (run_.command.cut ? "" : " ");
    if (may_ask) may_ask = !std::regex_search(std::regex_replace(command, kQuoted, ""), kOption);
    run_.ruv = may_ask ? "started_or_declined" : "started";
  }
};
}  // namespace

bool Matches(std::string_view message, std::string_view expected) {
  if (message.substr(0, expected.size()) != expected) return false;
  return message.size() == expected.size() || message[expected.size()] == '\n' ||
         std::string_view(" [\"").find(expected.back()) != std::string_view::npos;
}

bool Read(const std::vector<std::string>& messages, Run& run, std::vector<std::string>& expected) {
  return Parser{messages.data(), messages.data() + messages.size(), run, expected}.Read();
}
}  // namespace ruv_trace
