#include "run.h"

namespace ruv_trace {
namespace {

bool EndsWith(std::string_view text, std::string_view end) {
  return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

// Returns what a shell that could not run the copy script wrote about it: the rest of "sh: ...SCRIPT: REASON".
std::string ComplaintIn(std::string_view line, std::string_view copy_command) {
  if (line.substr(0, 4) != "sh: " || copy_command.empty()) return "";
  const std::string script(copy_command.substr(1, copy_command.find('"', 1) - 1));
  const std::size_t position = line.find(script + ": ");
  return position == std::string_view::npos ? "" : std::string(line.substr(position + script.size() + 2));
}

}  // namespace

bool Run::Finished() const { return Last() == kEnd; }

bool Run::RunsCopyScript() const { return Last() == kCopyScript; }

bool Run::RunsApplication() const { return Last() == kApplication && !IsMixed(); }

bool Run::MayHaveEnded() const {
  return Last() == kOwnDirectory || Last() == kOptions || Last() == kUnknownOption || Last() == kOptionsLeft;
}

void Run::TakeOther(std::string_view text) {
  if (frozen_) return;
  if (RunsCopyScript()) {
    if (facts_.copy_output_lines++ == 0) facts_.shell_complaint = ComplaintIn(text, facts_.copy_command.text);
    return;
  }
  if (!awaits_exit_code_ && Last() != kApplication) return;
  Command& command = awaits_exit_code_ ? facts_.calls.back().command : facts_.command;
  if (EndsWith(command.text, " 2>/dev/null") || EndsWith(command.text, " 2>&1")) return;
  const std::string more = ("\n" + std::string(text)).substr(0, command.room);
  command.text += more;
  command.room -= more.size();
}

void Run::BeginBeforeEndOf(const Run& other) {
  run_before_ = other.number;
  doubtful_after_.push_back(other.last_);
  frozen_ = frozen_ || other.IsDoubtful();
}

void Run::Doubt(std::string_view reason) {
  if (!IsMixed()) doubt_ = reason;
  frozen_ = true;
  facts_ = {};
}

Identity Run::Machine() const {
  const auto either = [](const auto& used, const auto& discovered) { return used ? used : discovered; };
  return {either(facts_.used.machine_type, facts_.discovered.machine_type),
          either(facts_.used.system, facts_.discovered.system),
          either(facts_.used.architecture, facts_.discovered.architecture)};
}

std::string Run::Problem() const {
  for (const ToolCall& call : facts_.calls) {
    if (call.Failed()) return call.verb + " " + std::to_string(*call.exit_code) + ": " + std::string(call.Meaning());
  }
  if (facts_.package == kNoCopyScriptFound) return "the package has no copy script";
  if (facts_.package == kCopyScriptNotRun) return "copy script not run: " + facts_.shell_complaint;
  if (installed_again) return facts_.package_version + " installed again: the last installation did not take";
  if (!facts_.option_without_value.empty()) return "option " + facts_.option_without_value + " has no value";
  const Identity& machine = facts_.discovered;
  if (machine.system == kUnknown && machine.machine_type == kUnknown && machine.architecture == kUnknown) {
    return "machine unknown: no system information";
  }
  return "";
}

std::string Run::Unclear() const {
  if (!doubt_.empty()) return std::string(doubt_);
  if (frozen_) return "unfinished run " + std::to_string(run_before_) + " may have gone on in its place";
  if (awaits_exit_code_) return "unfinished: in tavtool";
  switch (Last()) {
    case kOwnDirectory:
      return "the launcher's directory was not found, or unfinished";
    case kHelper:
      return "unfinished: in guihelper.sh";
    case kOptions:
    case kUnknownOption:
      return "help shown, or unfinished";
    case kOptionsLeft:
      return "options rejected, or unfinished";
    case kCopyScript:
      return "unfinished: in the copy script";
    case kApplication:
      return "unfinished: in ruv or at the question before it";
    case kEnd:
      return "";
    default:
      return "unfinished: between two steps";
  }
}

}  // namespace ruv_trace
