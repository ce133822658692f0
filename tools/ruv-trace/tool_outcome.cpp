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
  const char *success, *package_after_success, *package_after_failure, *package_if_nothing_newer;
};
const Verb kVerbs[] = {
    {TAVTOOL_CMD_COMPWEB, "update available", "available", "check_failed", "nothing_newer"},
    {TAVTOOL_CMD_ACQUIRE, "success", "downloaded", "download_failed", ""},
    {TAVTOOL_CMD_COMPLOC, "nothing newer", "nothing_newer", "check_failed", "nothing_newer"},
    {TAVTOOL_CMD_EXPAND, "success", "expanded", "expansion_failed", ""},
    {TAVTOOL_CMD_COPY, "success", "", "", ""},
};

std::string FailureText(int exit_code) {
  const std::string message = MessageOf(exit_code);
  if (!message.empty()) return message.substr(0, message.find_first_of(".\n"));
  if (exit_code == -1) return "the shell could not be started or waited for";
  if (exit_code == 126) return "tavtool cannot be executed";
  if (exit_code == 127) return "tavtool not found, or no shell could be started";
  return exit_code > 128 ? "unknown exit code, or ended by a signal" : "unknown exit code";
}
}  // namespace

std::string TakeExitCode(ToolCall& call, int exit_code) {
  const auto is = [&](const Verb& each) { return each.name == call.verb; };
  const Verb& verb = *std::find_if(std::begin(kVerbs), std::end(kVerbs), is);
  const bool compares = call.verb == TAVTOOL_CMD_COMPLOC, expands = call.verb == TAVTOOL_CMD_EXPAND;
  const int result = ResultOf(exit_code);
  // 30 is "You already have the latest version", the others "There's no update available".
  const bool nothing = exit_code == 30 || exit_code == 31 || exit_code == 33 || exit_code == 40;
  const bool expected = result == kSuccess || compares || (expands && result == kNoPayload);
  const bool ok = result == kFailure ? nothing && !expands && call.verb != TAVTOOL_CMD_ACQUIRE : expected;
  call.exit_code = exit_code;
  call.result = ok ? "ok" : "problem";
  call.meaning = result == kFailure ? FailureText(exit_code) : ok ? verb.success : "unexpected exit code";
  if (result == kNoPayload && ok) call.meaning = "no payload";
  if (result == kPackageToInstall && ok) call.meaning = "newer package";
  if (!ok) return verb.package_after_failure;
  if (result == kPackageToInstall) return "available";
  return nothing ? verb.package_if_nothing_newer : verb.package_after_success;
}
}  // namespace ruv_trace
