#include "tool_call.h"

#include "packages/exit_code_tables.h"

namespace ruv_trace {
namespace {

// What the message table has no words for: exit codes of the shell, and of a shell that could not be started.
constexpr NZEMRUVTAV::ErrMsg kNotRun[] = {
    {-1, "no shell could be started"},
    {126, "tavtool cannot be executed"},
    {127, "tavtool not found"},
};

std::string_view SuccessOf(std::string_view verb) {
  if (verb == "compareweb") return "update available";
  if (verb == "comparelocal") return "nothing newer";
  return "success";
}

// Takes off the text what stands before the mark, and the mark; nothing when there is none.
std::optional<std::string> TakeUntil(std::string_view& text, std::string_view mark) {
  const std::size_t position = text.find(mark);
  if (position == std::string_view::npos) return {};
  const std::string before(text.substr(0, position));
  text.remove_prefix(position + mark.size());
  return before;
}

}  // namespace

int ToolCall::Result() const {
  for (const NZEMRUVTAV::ToolResult& known : NZEMRUVTAV::kToolResults) {
    if (known.exit_code == exit_code) return known.result;
  }
  return NZEMRUVTAV::kFailure;
}

std::string_view ToolCall::Meaning() const {
  if (!exit_code) return "no exit code";
  switch (Result()) {
    case NZEMRUVTAV::kSuccess:
      return SuccessOf(verb);
    case NZEMRUVTAV::kPackageToInstall:
      return verb == "comparelocal" ? "newer package" : "unexpected code";
    case NZEMRUVTAV::kNoPayload:
      return verb == "expand" || verb == "comparelocal" ? "no payload" : "unexpected code";
    default:
      break;
  }
  for (const NZEMRUVTAV::ErrMsg& known : NZEMRUVTAV::ErrMsgs) {
    const std::string_view message = known.message;
    if (known.exit_code == exit_code) return message.substr(0, message.find('\n'));
  }
  for (const NZEMRUVTAV::ErrMsg& known : kNotRun) {
    if (known.exit_code == exit_code) return known.message;
  }
  return exit_code > 128 && exit_code <= 128 + 64 ? "unknown code, or ended by a signal" : "unknown code";
}

ToolCall ParseToolCommand(std::string_view command, Identity& used) {
  ToolCall call;
  // PROGRAM VERB -l "PATH" [-s|-t "PATH"] -m TYPE -o SYSTEM -a ARCHITECTURE ...; the program's path may hold blanks.
  const std::optional<std::string> beginning = TakeUntil(command, " -l \"");
  if (!beginning) return call;
  call.verb = beginning->substr(beginning->rfind(' ') + 1);
  if (!TakeUntil(command, "\" -m ")) return call;
  if (const auto type = TakeUntil(command, " -o ")) used.machine_type = type;
  if (const auto system = TakeUntil(command, " -a ")) used.system = system;
  if (const auto architecture = TakeUntil(command, " ")) used.architecture = architecture;
  return call;
}

}  // namespace ruv_trace
