// The exit codes of the package tool, as the launcher understands them.
#include <algorithm>

#include "launcher/command_fragments.h"
#include "packages/exit_code_tables.h"
#include "run.h"

namespace ruv_trace {
namespace {

using namespace NZEMRUVTAV;

struct Verb {
  const std::string& name;
  const char *success, *package_after_success, *package_after_failure;
};
const Verb kVerbs[] = {
    {TAVTOOL_CMD_COMPWEB, "update available", "available", "check_failed"},
    {TAVTOOL_CMD_ACQUIRE, "success", "downloaded", "download_failed"},
    {TAVTOOL_CMD_COMPLOC, "nothing newer", "nothing_newer", "check_failed"},
    {TAVTOOL_CMD_EXPAND, "success", "expanded", "expansion_failed"},
    {TAVTOOL_CMD_COPY, "success", "", ""},
};

int ResultOf(int exit_code) {
  for (const ToolResult& known : kToolResults) {
    if (known.exit_code == exit_code) return known.result;
  }
  return kFailure;
}

std::string FailureText(int exit_code) {
  const std::string text = ErrorText(exit_code);
  if (!text.empty()) return text.substr(0, text.find('.'));
  if (exit_code == -1) return "the shell could not be started or waited for";
  if (exit_code == 126) return "tavtool cannot be executed";
  if (exit_code == 127) return "tavtool not found, or no shell could be started";
  return exit_code > 128 ? "unknown exit code, or ended by a signal" : "unknown exit code";
}

}  // namespace

std::string ErrorText(int exit_code) {
  for (const ErrMsg& known : ErrMsgs) {
    const std::string message = known.message;
    if (known.exit_code == exit_code) return message.substr(0, message.find('\n'));
  }
  return "";
}

ToolOutcome OutcomeOf(const std::string& name, int exit_code) {
  const Verb& verb = *std::find_if(std::begin(kVerbs), std::end(kVerbs), [&](const Verb& v) { return v.name == name; });
  const bool compares = name == TAVTOOL_CMD_COMPLOC, expands = name == TAVTOOL_CMD_EXPAND;
  const int result = ResultOf(exit_code);
  if (result == kSuccess) return {false, verb.success, verb.package_after_success};
  if (result == kPackageToInstall && compares) return {false, "newer package", "available"};
  if (result == kNoPayload && (compares || expands)) return {false, "no payload", verb.package_after_success};
  if (result != kFailure) return {true, "unexpected exit code", verb.package_after_failure};
  // 30 is "You already have the latest version", the others "There's no update available".
  const bool nothing = exit_code == 30 || exit_code == 31 || exit_code == 33 || exit_code == 40;
  const bool failed = !nothing || expands || name == TAVTOOL_CMD_ACQUIRE;
  const char* nothing_newer = name == TAVTOOL_CMD_COPY ? "" : "nothing_newer";
  return {failed, FailureText(exit_code), failed ? verb.package_after_failure : nothing_newer};
}

}  // namespace ruv_trace
