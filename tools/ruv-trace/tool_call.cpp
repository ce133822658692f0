#include "tool_call.h"

#include <algorithm>
#include <iterator>

#include "launcher/command_fragments.h"
#include "packages/exit_code_tables.h"

namespace ruv_trace {
namespace {

struct Verb {
  const std::string& name;
  std::string_view success;  // in words
  std::string_view package_after_success;
  std::string_view package_after_failure;
};

const Verb& VerbOf(const ToolCall& call) {
  static const Verb kVerbs[] = {
      {NZEMRUVTAV::TAVTOOL_CMD_COMPWEB, "update available", kAvailable, kCheckFailed},
      {NZEMRUVTAV::TAVTOOL_CMD_ACQUIRE, "success", kDownloaded, kDownloadFailed},
      {NZEMRUVTAV::TAVTOOL_CMD_COMPLOC, "nothing newer", kNothingNewer, kCheckFailed},
      {NZEMRUVTAV::TAVTOOL_CMD_EXPAND, "success", kExpanded, kExpansionFailed},
      {NZEMRUVTAV::TAVTOOL_CMD_COPY, "success", "", ""},
  };
  return *std::find_if(std::begin(kVerbs), std::end(kVerbs), [&](const Verb& verb) { return verb.name == call.verb; });
}

// Removes everything up to and including the mark and returns the part before it. Returns nullopt if there is no mark.
std::optional<std::string> TakeUntil(std::string_view& text, std::string_view mark) {
  const std::size_t position = text.find(mark);
  if (position == std::string_view::npos) return {};
  const std::string before(text.substr(0, position));
  text.remove_prefix(position + mark.size());
  return before;
}

// Returns the launcher's result for an exit code: one of those in exit_code_tables.h.
int ResultOf(int exit_code) {
  for (const NZEMRUVTAV::ToolResult& known : NZEMRUVTAV::kToolResults) {
    if (known.exit_code == exit_code) return known.result;
  }
  return NZEMRUVTAV::kFailure;
}

}  // namespace

std::string_view ErrorText(int exit_code) {
  for (const NZEMRUVTAV::ErrMsg& known : NZEMRUVTAV::ErrMsgs) {
    const std::string_view message = known.message;
    if (known.exit_code == exit_code) return message.substr(0, message.find('\n'));
  }
  return "";
}

bool ToolCall::Failed() const {
  if (!exit_code) return false;
  const bool in_repository = verb == NZEMRUVTAV::TAVTOOL_CMD_COMPLOC;
  const bool installs = verb == NZEMRUVTAV::TAVTOOL_CMD_ACQUIRE || verb == NZEMRUVTAV::TAVTOOL_CMD_EXPAND;
  switch (ResultOf(*exit_code)) {
    case NZEMRUVTAV::kSuccess:
      return false;
    case NZEMRUVTAV::kPackageToInstall:
      return !in_repository;
    case NZEMRUVTAV::kNoPayload:
      return !in_repository && verb != NZEMRUVTAV::TAVTOOL_CMD_EXPAND;
    default:  // 30 is "You already have the latest version", the others "There's no update available"
      return installs || (exit_code != 30 && exit_code != 31 && exit_code != 33 && exit_code != 40);
  }
}

std::string_view ToolCall::Meaning() const {
  if (!exit_code) return "no exit code";
  switch (ResultOf(*exit_code)) {
    case NZEMRUVTAV::kSuccess:
      return VerbOf(*this).success;
    case NZEMRUVTAV::kPackageToInstall:
      return Failed() ? "unexpected exit code" : "newer package";
    case NZEMRUVTAV::kNoPayload:
      return Failed() ? "unexpected exit code" : "no payload";
    default:
      break;
  }
  const std::string_view text = ErrorText(*exit_code);
  if (!text.empty()) return text.substr(0, text.find_last_not_of('.') + 1);
  switch (*exit_code) {
    case -1:
      return "the shell could not be started or waited for";
    case 126:
      return "tavtool cannot be executed";
    case 127:
      return "tavtool not found, or no shell could be started";
    default:
      return *exit_code > 128 ? "unknown exit code, or ended by a signal" : "unknown exit code";
  }
}

std::string_view ToolCall::Package() const {
  if (Failed()) return VerbOf(*this).package_after_failure;
  const int result = ResultOf(*exit_code);
  if (result == NZEMRUVTAV::kPackageToInstall) return kAvailable;
  if (result == NZEMRUVTAV::kFailure) return verb == NZEMRUVTAV::TAVTOOL_CMD_COPY ? "" : kNothingNewer;
  return VerbOf(*this).package_after_success;
}

void ToolCall::ReadIdentity(Identity& identity) const {
  // PROGRAM VERB -l "PATH" [-s|-t "PATH"] -m TYPE -o SYSTEM -a ARCHITECTURE ...
  std::string_view rest = command.text;
  if (!TakeUntil(rest, "\" -m ")) return;
  if (const auto type = TakeUntil(rest, " -o ")) identity.machine_type = type;
  if (const auto system = TakeUntil(rest, " -a ")) identity.system = system;
  if (const auto architecture = TakeUntil(rest, " ")) identity.architecture = architecture;
}

}  // namespace ruv_trace
