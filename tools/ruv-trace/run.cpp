#include "run.h"

#include <algorithm>
#include <charconv>
#include <initializer_list>

#include "log/trace_format.h"
#include "packages/exit_code_tables.h"

namespace ruv_trace {
namespace {

bool IsOneOf(std::string_view word, std::initializer_list<std::string_view> words) {
  return std::find(words.begin(), words.end(), word) != words.end();
}

bool EndsWith(std::string_view text, std::string_view end) {
  return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

// Returns the last argument of "SCRIPT" "EXPANSION" "APPLICATION" "SOURCE" VERSION 1>>..., or "" if it is not there.
std::string VersionIn(std::string_view copy_command) {
  const std::size_t end = copy_command.rfind(" 1>>");
  const std::size_t quote = copy_command.rfind("\" ", end);
  if (end == std::string_view::npos || quote == std::string_view::npos || quote + 2 > end) return "";
  return std::string(copy_command.substr(quote + 2, end - quote - 2));
}

// Returns what a shell that could not run the copy script wrote about it: the rest of "sh: ...SCRIPT: REASON".
std::string ComplaintIn(std::string_view line, std::string_view copy_command) {
  if (line.substr(0, 4) != "sh: " || copy_command.empty()) return "";
  const std::string script(copy_command.substr(1, copy_command.find('"', 1) - 1));
  const std::size_t position = line.find(script + ": ");
  return position == std::string_view::npos ? "" : std::string(line.substr(position + script.size() + 2));
}

// Removes the next word from a command, up to a blank outside double quotes, and returns it.
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

// Whether the application's command shows that -b, -i or -r was given. An argument that holds blanks and a dash is in
// the command as typed, and looks like several; that is not told apart.
bool SuppressesQuestion(const Command& command) {
  std::string_view rest = command.text;
  TakeWord(rest);  // the application
  while (!rest.empty()) {
    std::string_view word = TakeWord(rest);
    const bool takes_value = IsOneOf(word, {"-d", "-html"});
    if (takes_value) word = TakeWord(rest);
    if (rest.empty() && command.MayBeCut()) return false;  // the word may be longer
    if (takes_value ? IsOneOf(word, {"\"-b\"", "\"-i\"", "\"-r\""}) : IsOneOf(word, {"-b", "-i", "-r"})) return true;
  }
  return false;
}

}  // namespace

bool Run::TakeSystem(std::string_view text) {
  facts_.discovered.system = text;
  return true;
}

bool Run::TakeMachineType(std::string_view text) {
  facts_.discovered.machine_type = text;
  return true;
}

bool Run::TakeArchitecture(std::string_view text) {
  facts_.discovered.architecture = text;
  return true;
}

bool Run::TakeCheck(std::string_view) {
  facts_.mode = kCheckMode;
  return true;
}

bool Run::TakeDownload(std::string_view) {
  facts_.mode = kUpdateMode;
  return true;
}

bool Run::TakeLaunch(std::string_view) {
  facts_.mode = kLaunchMode;
  return true;
}

// A launch without the test for a portable installation: packages are ignored, and no question is asked.
bool Run::TakeRemoteLaunch(std::string_view) {
  no_question_ = true;
  facts_.mode = kLaunchMode;
  return true;
}

bool Run::TakeToolCommand(const std::string& verb, std::string_view text) {
  facts_.calls.push_back({verb, {std::string(text), room_}});
  facts_.calls.back().ReadIdentity(facts_.used);
  return true;
}

bool Run::TakeExitCode(std::string_view text) {
  int exit_code = 0;
  const auto [rest, error] = std::from_chars(text.data(), text.data() + text.size(), exit_code);
  if (error != std::errc() || rest != text.data() + text.size()) return false;
  ToolCall& call = facts_.calls.back();
  call.exit_code = exit_code;
  result_ = call.Result();
  if (!call.Package().empty()) facts_.package = call.Package();
  for (const NZEMRUVTAV::ErrMsg& known : NZEMRUVTAV::ErrMsgs) {
    const std::string_view message = known.message;
    if (known.exit_code == exit_code) message_due_ = message.substr(0, message.find('\n'));
  }
  return true;
}

bool Run::TakeNoCopyScript(std::string_view) {
  facts_.package = kNoCopyScriptFound;
  return true;
}

bool Run::TakeCopyCommand(std::string_view text) {
  facts_.copy_command = {std::string(text), room_};
  facts_.package_version = VersionIn(text);
  return true;
}

// The installation makes the machine type a supported one, so that no question is asked.
bool Run::TakeCopyEnd(std::string_view) {
  no_question_ = true;
  if (output_lines_ != 1) facts_.shell_complaint.clear();
  facts_.package = facts_.shell_complaint.empty() ? kCopyScriptRan : kCopyScriptNotRun;
  return true;
}

bool Run::TakeMissingValue(std::string_view text) {
  facts_.option_without_value = text;
  return true;
}

bool Run::TakeCommand(std::string_view text) {
  facts_.command = {std::string(text), room_};
  return true;
}

bool Run::TakeEnd(std::string_view) {
  if (facts_.package == kUnknown) facts_.package = kNotChecked;
  if (facts_.mode != kLaunchMode) {
    facts_.application = kNotStarted;
  } else {
    facts_.application = no_question_ || SuppressesQuestion(facts_.command) ? kStarted : kStartedOrDeclined;
  }
  return true;
}

void Run::TakeOther(std::string_view text) {
  if (RunsCopyScript()) {
    if (output_lines_++ == 0) facts_.shell_complaint = ComplaintIn(text, facts_.copy_command.text);
    return;
  }
  Command* command = nullptr;
  if (!facts_.command.text.empty()) {
    command = &facts_.command;
  } else if (!facts_.calls.empty() && !facts_.calls.back().exit_code) {
    command = &facts_.calls.back().command;
  }
  if (command == nullptr || EndsWith(command->text, " 2>/dev/null") || EndsWith(command->text, " 2>&1")) return;
  const std::string more = ("\n" + std::string(text)).substr(0, command->room);
  command->text += more;
  command->room -= more.size();
}

void Run::BeginBeforeEndOf(const Run& other) {
  run_before = other.number;
  doubtful_after_ = other.state_;
  if (other.IsMixed()) certain_ = Facts();
}

void Run::Doubt(std::string_view reason) {
  if (!IsMixed()) doubt_ = reason;
  certain_ = Facts();
}

Identity Run::Machine() const {
  const auto either = [](const auto& used, const auto& discovered) { return used ? used : discovered; };
  const Facts& known = Known();
  return {either(known.used.machine_type, known.discovered.machine_type),
          either(known.used.system, known.discovered.system),
          either(known.used.architecture, known.discovered.architecture)};
}

std::string Run::Problem() const {
  const Facts& known = Known();
  for (const ToolCall& call : known.calls) {
    if (call.Failed()) return call.verb + " " + std::to_string(*call.exit_code) + ": " + std::string(call.Meaning());
  }
  if (known.package == kNoCopyScriptFound) return "the package has no copy script";
  if (known.package == kCopyScriptNotRun) return "copy script not run: " + known.shell_complaint;
  if (installed_again) {
    return known.package_version + " installed again: the last installation did not take";
  }
  if (!known.option_without_value.empty()) return "option " + known.option_without_value + " has no value";
  const Identity& machine = known.discovered;
  if (machine.system == kUnknown && machine.machine_type == kUnknown && machine.architecture == kUnknown) {
    return "machine unknown: no system information";
  }
  return "";
}

std::string Run::Unclear() const {
  if (!doubt_.empty()) return std::string(doubt_);
  if (certain_) return "unfinished run " + std::to_string(run_before) + " may have gone on in its place";
  return Finished() ? "" : std::string(Unfinished());
}

}  // namespace ruv_trace
