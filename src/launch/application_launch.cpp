// The last step: builds the application's command line and runs it, on an unsupported machine after a question.
#include <algorithm>
#include <iterator>

#include "launch/yes_no_question.h"
#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {
namespace {

// True for the application's options whose value is always quoted.
bool TakesQuotedValue(const std::string& argument) {
  constexpr const char* kSpecialParameters[] = {"-i", "-r", "-d", "-html"};
  return std::any_of(std::begin(kSpecialParameters), std::end(kSpecialParameters),
                     [&](const char* special) { return argument == special; });
}

}  // namespace

int TAVMaster::InvokeRUV(std::string application_path, std::vector<std::string> arguments,
                         bool warn_unsupported) const {
  const TraceScope trace(*this, __func__);
  std::string command = LaunchCommand(application_path, arguments);
  FormatCommandString(command);
  DebugLog("[Status:]InvokeRUV: command = %s", command.c_str());

  if (warn_unsupported) {
    PrintLine("You might need to download an update for RUV to support this system.");
    PrintLine("Use the -? or -h parameter for more information about downloading updates.");
    if (!batchMode && !UserAgrees()) {
      PrintLine("Exit RUV");
      return 1;
    }
  }
  RunInShell(command);
  return 1;
}

std::string TAVMaster::LaunchCommand(const std::string& application_path,
                                     const std::vector<std::string>& arguments) const {
  std::string command = application_path;
  for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
    command += kSpaceSeparator + *argument;
    if (!TakesQuotedValue(*argument)) continue;
    DebugLog("[Debug:] Processing special parameters [%s]", argument->c_str());
    if (std::next(argument) == arguments.end()) {
      DebugLog("[Error:]InvokeRUV: required parameters are missing for option = %s", argument->c_str());
      break;
    }
    ++argument;
    command += kSpaceSeparator + Quoted(*argument);
  }
  return command;
}

}  // namespace NZEMRUVTAV
