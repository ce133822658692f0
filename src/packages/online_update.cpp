// Update mode: is there a newer package on the web, and its download.
#include "launcher/command_fragments.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/tool_command.h"

namespace NZEMRUVTAV {

int TAVMaster::CheckUpdate() {
  const TraceScope trace(*this, "CheckUpdate");
  ToolCall check;
  check.verb = TAVTOOL_CMD_COMPWEB;
  check.local_path = GetWorkingPath();
  check.online_flags = "--latest";
  const std::string command = ToolCommand(check);
  DebugLog("[Status:]CheckUpdate:TAVToolCmd = %s", command.c_str());
  return HandleTAVToolReturnValue(RunInShell(command));
}

int TAVMaster::AcquireUpdate() {
  const TraceScope trace(*this, "AcquireUpdate");
  const std::string download_path = isPortableRUV() ? PortableUpdateFolder() : GetRepositoryPath();
  EnsureDirectory(download_path, OutputToNULL, "AcquireUpdate");
  ToolCall download;
  download.verb = TAVTOOL_CMD_ACQUIRE;
  download.local_path = download_path;
  download.online_flags = "--force --latest";
  const std::string command = ToolCommand(download);
  DebugLog("[Status:]AcquireUpdate: TAVToolCmd = %s", command.c_str());
  return HandleTAVToolReturnValue(RunInShell(command));
}

}  // namespace NZEMRUVTAV
