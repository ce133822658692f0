#include "run.h"

#include <algorithm>
#include <initializer_list>

#include "log/trace_format.h"
#include "packages/exit_code_tables.h"

namespace ruv_trace {
namespace {

// A run calls the package tool five times at most; a trace that says otherwise is none.
constexpr std::size_t kMostCalls = 16;

constexpr std::string_view kApplicationCommandBegins = "[Status:]InvokeRUV: command = ";
constexpr std::string_view kCommandEnd = " 2>/dev/null";  // unless the user wants to see standard error
constexpr std::size_t kLongestCommand = NZEMRUVTAV::kMessageBufferSize - 1 - kApplicationCommandBegins.size();

constexpr std::string_view kExpanding = "expansion unfinished";
constexpr std::string_view kExpanded = "expanded, not installed";
constexpr std::string_view kNotExpanded = "not installed: expansion failed";
constexpr std::string_view kNoScript = "not installed: it has no copy script";
constexpr std::string_view kScriptStarted = "copy script unfinished";
constexpr std::string_view kScriptRan = "copy script ran";

bool IsOneOf(std::string_view word, std::initializer_list<std::string_view> words) {
  return std::find(words.begin(), words.end(), word) != words.end();
}

// "SCRIPT" "DIRECTORY" "DIRECTORY" "SOURCE" VERSION 1>>..., with nothing for the version when it is not known.
std::string VersionInCopyCommand(std::string_view command) {
  const std::size_t quote = command.rfind("\" ");
  const std::size_t end = command.find(" 1>>", quote + 1);
  if (quote == std::string_view::npos || end == std::string_view::npos || end < quote + 2) return "";
  return std::string(command.substr(quote + 2, end - quote - 2));
}

// Takes the next word off a command: up to a blank outside of double quotes.
std::string_view TakeWord(std::string_view& command) {
  bool quoted = false;
  std::size_t length = 0;
  while (length < command.size() && (quoted || command[length] != ' ')) {
    if (command[length++] == '"') quoted = !quoted;
  }
  const std::string_view word = command.substr(0, length);
  command.remove_prefix(std::min(length + 1, command.size()));
  return word;
}

}  // namespace

bool Run::Expects(const Message& message) const {
  if (finished_) return false;
  switch (message.kind) {
    case Kind::kBegin:
      return false;
    case Kind::kEntry:
      return where_ == CallerOf(message.member) && !awaits_tool_exit_;
    case Kind::kExit:
      return where_ == message.member && !awaits_tool_exit_ && !LacksItsCommand();
    case Kind::kIdentity:
      return where_ == message.member && !(discovered.*message.field);
    case Kind::kPortableTest:
      return where_ == kDriver || where_ == kDownload;
    case Kind::kToolCommand:
      return where_ == message.member && !awaits_tool_exit_;
    case Kind::kToolExit:
      return awaits_tool_exit_;
    case Kind::kCopyCommand:
    case Kind::kNoCopyScript:
      return where_ == message.member && !in_copy_script_;
    case Kind::kCopied:  // also where the script's last words took the line of its end along
      return where_ == kExpansion || in_copy_script_;
    case Kind::kApplicationCommand:
      return where_ == message.member && command.empty();
  }
  return false;
}

// Whether the run is in a member that traces a command before it ends, and has not yet.
bool Run::LacksItsCommand() const {
  if (where_ == kLaunch) return command.empty();
  return where_ == kCopying && !in_copy_script_ && package != kNoScript;
}

void Run::Take(const Message& message) {
  lines_missing = lines_missing || (message.kind != Kind::kBegin && !Expects(message));
  if (message.kind != Kind::kToolExit) awaits_tool_exit_ = false;
  if (message.member != kOutside && message.kind != Kind::kPortableTest) {
    where_ = message.kind == Kind::kExit ? CallerOf(message.member) : message.member;
    entered_ |= 1U << message.member;
    in_copy_script_ = false;
  }
  switch (message.kind) {
    case Kind::kBegin:
      break;
    case Kind::kEntry:
      if (message.member == kExpansion) package = kExpanding;
      break;
    case Kind::kExit:
      if (message.member == kSessionEnd) finished_ = true;
      if (message.member == kCopying && package == kScriptStarted) package = kScriptRan;
      break;
    case Kind::kIdentity:
      discovered.*message.field = message.text;
      break;
    case Kind::kPortableTest:
      portable_tested_ = true;
      break;
    case Kind::kToolCommand:
      awaits_tool_exit_ = true;
      AddCall(ParseToolCommand(message.text, used));
      break;
    case Kind::kToolExit:
      TakeToolExit(message.exit_code);
      break;
    case Kind::kCopyCommand:
      in_copy_script_ = true;
      package = kScriptStarted;
      package_version = VersionInCopyCommand(message.text);
      break;
    case Kind::kNoCopyScript:
      package = kNoScript;
      break;
    case Kind::kCopied:
      package = kScriptRan;
      break;
    case Kind::kApplicationCommand:
      command.clear();
      TakeCommand(message.text);
      break;
  }
  last_kind_ = message.kind;
  last_member_ = message.member;
}

void Run::AddCall(const ToolCall& call) {
  if (calls.size() == kMostCalls) {
    calls.pop_back();
    lines_missing = true;
  }
  calls.push_back(call);
}

void Run::TakeToolExit(int exit_code) {
  if (!awaits_tool_exit_ || calls.empty()) AddCall({});
  awaits_tool_exit_ = false;
  calls.back().exit_code = exit_code;
  const int result = calls.back().Result();
  if (where_ == kExpansion)
    package = result == NZEMRUVTAV::kSuccess || result == NZEMRUVTAV::kNoPayload ? kExpanded : kNotExpanded;
}

void Run::TakeCommand(std::string_view text) {
  command += text.substr(0, kLongestCommand - command.size());
  command_cut = command.size() == kLongestCommand;
}

void Run::TakeContinuation(std::string_view text) {
  const std::size_t redirection = command.rfind(kCommandEnd);
  const bool whole = redirection != std::string::npos && redirection + kCommandEnd.size() == command.size();
  if (last_kind_ != Kind::kApplicationCommand || command_cut || whole) return;
  TakeCommand("\n");
  TakeCommand(text);
}

std::string_view Run::Mode() const {
  if (Entered(kDownload)) return "update";
  // Both modes begin with the online check, and only the successful one of an update goes on from there.
  if (Entered(kCheck)) {
    return finished_ && !lines_missing && !calls.empty() && calls[0].Result() == NZEMRUVTAV::kSuccess
               ? "check"
               : "check or update";
  }
  if (Entered(kLaunch) || Entered(kImport)) return "launch";
  return !lines_missing && portable_tested_ ? "launch" : "";
}

// No question is asked on a machine that a package was just installed for, in batch mode, with an input file and for a
// remote target. An argument that holds blanks and a dash is on the command as it was typed, so that one with such a
// word inside it looks the same; nobody writes that by chance.
bool Run::CannotHaveAsked() const {
  if (package == kScriptRan) return true;
  std::string_view rest = command;
  TakeWord(rest);  // the application
  while (!rest.empty()) {
    const std::string_view word = TakeWord(rest);
    if (rest.empty() && command_cut) return false;  // the word may be longer
    if (IsOneOf(word, {"-b", "-i", "-r", "--ipmi-lan", "--vmware-esxi"})) return true;
    if (!IsOneOf(word, {"-d", "-html"})) continue;
    const std::string_view value = TakeWord(rest);
    if (rest.empty() && command_cut) return false;
    if (IsOneOf(value, {"\"-b\"", "\"-i\"", "\"-r\"", "\"--ipmi-lan\"", "\"--vmware-esxi\""})) return true;
  }
  return false;
}

std::string_view Run::Application() const {
  if (command.empty()) return lines_missing || where_ == kLaunch ? "unknown" : "not started";
  if (CannotHaveAsked()) return "started";
  return where_ == kLaunch ? "unknown" : "started or declined";
}

std::string_view Run::Ended() const {
  if (finished_) return "completed";
  // The driver's next step follows at once, and writes a line.
  const bool options_read_last = last_kind_ == Kind::kExit && last_member_ == kOptions;
  return options_read_last ? "options rejected, or cut short" : EndedIn(where_);
}

}  // namespace ruv_trace
