// The last step: the application's command line, the question on unsupported machines, and the application itself.
#include <algorithm>
#include <cctype>
#include <cstdio>
#include <iterator>

#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {
namespace {

constexpr const char* kQuestion = "Do you want to proceed anyway (function may be limited)? (Y/N)";

// The application's options whose value is always quoted, whatever it is.
bool TakesQuotedValue(const std::string& argument) {
  constexpr const char* kSpecialParameters[] = {"-i", "-r", "-d", "-html"};
  return std::any_of(std::begin(kSpecialParameters), std::end(kSpecialParameters),
                     [&](const char* special) { return argument == special; });
}

// Reads one line from standard input and returns 'y' or 'n' when that letter, in either case, is all of it, and 0 for
// every other line. The end of the input and a read error count as "n". Reads byte by byte, so that what follows the
// line is left for the application.
int ReadAnswer() {
  std::setvbuf(stdin, nullptr, _IONBF, 0);
  std::clearerr(stdin);
  int answer = 0;
  std::size_t length = 0;
  int character = 0;
  while ((character = std::getchar()) != EOF && character != '\n') {
    if (length++ == 0) answer = std::tolower(character);
  }
  if (character == EOF && (length == 0 || std::ferror(stdin) != 0)) return 'n';
  return length == 1 && (answer == 'y' || answer == 'n') ? answer : 0;
}

bool UserAgrees() {
  for (;;) {
    Print(kQuestion);
    FlushConsole();
    const int answer = ReadAnswer();
    if (answer != 0) return answer == 'y';
  }
}

}  // namespace

int TAVMaster::InvokeRUV(std::string application_path, std::vector<std::string> arguments, bool warn_unsupported) {
  const TraceScope trace(*this, "InvokeRUV");
  std::string command = application_path;
  for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
    const bool takes_value = TakesQuotedValue(*argument);
    if (takes_value) DebugLog("[Debug:] Processing special parameters [%s]", argument->c_str());
    command += kSpaceSeparator + *argument;
    if (!takes_value) continue;
    if (std::next(argument) == arguments.end()) {
      DebugLog("[Error:]InvokeRUV: required parameters are missing for option = %s", argument->c_str());
      break;
    }
    ++argument;
    command += kSpaceSeparator + Quoted(*argument);
  }
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

}  // namespace NZEMRUVTAV
