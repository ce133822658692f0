// Packages that travel on portable media, brought into this machine's repository.
#include "launcher/command_fragments.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/tool_command.h"

namespace NZEMRUVTAV {

int TAVMaster::CopyPortableTAVToRepository() {
  const TraceScope trace(*this, "CopyPortableTAVToRepository");
  const std::string update_folder = PortableUpdateFolder();
  if (!DirExists(update_folder)) {
    DebugLog("[Status:]CopyPortableTAVToRepository: The directory <Portable>/update does not Exist!");
    return 1;
  }
  EnsureDirectory(GetRepositoryPath(), OutputToNULL, "CopyPortableTAVToRepository");
  ToolCall import;
  import.verb = TAVTOOL_CMD_COPY;
  import.local_path = update_folder;
  import.second_option = "-t";
  import.second_path = GetRepositoryPath();
  const std::string command = ToolCommand(import);
  DebugLog("[Status:]CopyPortableTAVToRepository: TAVToolCmd = %s", command.c_str());
  return HandleTAVToolReturnValue(RunInShell(command));
}

}  // namespace NZEMRUVTAV
