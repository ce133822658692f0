// Update mode: the online check and the download.
#include "launcher/command_fragments.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/tool_command.h"

namespace NZEMRUVTAV {

int TAVMaster::CheckUpdate() const {
  const TraceScope trace(*this, __func__);
  ToolCall check(TAVTOOL_CMD_COMPWEB, GetWorkingPath());
  check.online_flags = "--latest";
  const std::string command = ToolCommand(check);
  DebugLog("[Status:]CheckUpdate:TAVToolCmd = %s", command.c_str());
  return HandleTAVToolReturnValue(RunInShell(command));
}

int TAVMaster::AcquireUpdate() const {
  const TraceScope trace(*this, __func__);
  const std::string download_path = isPortableRUV() ? PortableUpdateFolder() : GetRepositoryPath();
  EnsureDirectory(download_path, __func__);
  ToolCall download(TAVTOOL_CMD_ACQUIRE, download_path);
  download.online_flags = "--force --latest";
  const std::string command = ToolCommand(download);
  DebugLog("[Status:]AcquireUpdate: TAVToolCmd = %s", command.c_str());
  return HandleTAVToolReturnValue(RunInShell(command));
}

}  // namespace NZEMRUVTAV
