// Asks the package tool whether the local repository has a package to install, and of which version.
#include <string_view>

#include "launcher/command_fragments.h"
#include "launcher/line_reader.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/tool_command.h"

namespace NZEMRUVTAV {
namespace {

constexpr std::string_view kVersionKey = "Version=";
constexpr std::size_t kVersionLength = 4;

// Sets the version to the (at most) four characters after the first key, on its line. Leaves it unchanged if there is
// none.
void ReadPackageVersion(std::string& version) {
  LineReader output(kToolOutputFile);
  std::string_view line;
  while (output.IsOpen() && output.Next(line)) {
    const std::size_t key = line.find(kVersionKey);
    if (key == std::string_view::npos) continue;
    version = line.substr(key + kVersionKey.size(), kVersionLength);
    return;
  }
}

}  // namespace

int TAVMaster::CompareTAVPackage(std::string repository_path, std::string installation_path) {
  const TraceScope trace(*this, __func__);
  EnsureDirectory(repository_path);
  EnsureDirectory(installation_path);
  ToolCall comparison(TAVTOOL_CMD_COMPLOC, repository_path);
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
