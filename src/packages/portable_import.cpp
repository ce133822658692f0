// Copies packages from portable media into this machine's repository.
#include "launcher/command_fragments.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/exit_code_tables.h"
#include "packages/tool_command.h"

namespace NZEMRUVTAV {

int TAVMaster::CopyPortableTAVToRepository() const {
  const TraceScope trace(*this, __func__);
  const std::string update_folder = PortableUpdateFolder();
  if (!DirExists(update_folder)) {
    DebugLog("[Status:]CopyPortableTAVToRepository: The directory <Portable>/update does not Exist!");
    return kFailure;
  }
  EnsureDirectory(GetRepositoryPath(), __func__);
  ToolCall import(TAVTOOL_CMD_COPY, update_folder);
  import.second_option = "-t";
  import.second_path = GetRepositoryPath();
  const std::string command = ToolCommand(import);
  DebugLog("[Status:]CopyPortableTAVToRepository: TAVToolCmd = %s", command.c_str());
  return HandleTAVToolReturnValue(RunInShell(command));
}

}  // namespace NZEMRUVTAV
