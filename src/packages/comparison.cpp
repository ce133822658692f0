// Does the local repository hold a package that the installed copy should take, and of which version?
#include <cstdio>
#include <string_view>

#include "launcher/command_fragments.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/tool_command.h"

namespace NZEMRUVTAV {
namespace {

constexpr std::string_view kVersionKey = "Version=";
constexpr std::size_t kVersionLength = 4;

// Reads on until the key has just been read; false when there is none. No line is held in memory, for the key cannot
// span two lines and the output may be of any size. The key's first character does not occur in it again, so a failed
// match can only begin anew with the character at hand.
bool SkipBehindKey(std::FILE* file) {
  std::size_t matched = 0;
  int character = 0;
  while (matched < kVersionKey.size() && (character = getc_unlocked(file)) != EOF) {
    if (character != kVersionKey[matched]) matched = 0;
    if (character == kVersionKey[matched]) ++matched;
  }
  return matched == kVersionKey.size();
}

// Sets the version to the (at most) four characters behind the first key, up to the end of their line. Leaves it alone
// when there is no key, no file, or a read error before that.
void ReadPackageVersion(std::string& version) {
  std::FILE* file = std::fopen(kToolOutputFile.c_str(), "r");
  if (file == nullptr) return;
  if (SkipBehindKey(file)) {
    std::string text;
    int character = 0;
    while (text.size() < kVersionLength && (character = std::getc(file)) != EOF && character != '\n') {
      text.push_back(static_cast<char>(character));
    }
    if (std::ferror(file) == 0) version = text;
  }
  std::fclose(file);
}

}  // namespace

int TAVMaster::CompareTAVPackage(std::string repository_path, std::string installation_path) {
  const TraceScope trace(*this, "CompareTAVPackage");
  EnsureDirectory(repository_path, OutputToNULL);
  EnsureDirectory(installation_path, OutputToNULL);
  ToolCall comparison;
  comparison.verb = TAVTOOL_CMD_COMPLOC;
  comparison.local_path = repository_path;
  comparison.second_option = "-s";
  comparison.second_path = installation_path;
  comparison.redirection = OutputToLog;
  const std::string command = ToolCommand(comparison);
  DebugLog("[Status:]CompareTAVPackage: TAVToolCmd = %s", command.c_str());
  const int status = RunInShell(command);
  ReadPackageVersion(packageVersion);  // whatever the status
  return HandleTAVToolReturnValue(status);
}

}  // namespace NZEMRUVTAV
