// Expansion of the repository's package, and its installation by the package's own copy script.
#include <sys/stat.h>

#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/exit_code_tables.h"
#include "packages/tool_command.h"

namespace NZEMRUVTAV {
namespace {

// Stands in for the package source when the tool found no payload.
constexpr const char* kNoPayloadMarker = "NO_TAV_PAYLOAD";

constexpr mode_t kCopyScriptMode = 0777;

}  // namespace

int TAVMaster::DecompressTAV(std::string repository_path, std::string expansion_path) {
  const TraceScope trace(*this, "DecompressTAV");
  EnsureDirectory(repository_path, OutputToNULL);
  EnsureDirectory(expansion_path, OutputToNULL);
  ToolCall expansion;
  expansion.verb = TAVTOOL_CMD_EXPAND;
  expansion.local_path = repository_path;
  expansion.second_option = "-t";
  expansion.second_path = expansion_path;
  expansion.program_quoted = false;
  const std::string command = ToolCommand(expansion);
  DebugLog("[Status:]DecompressTAV: TAVToolCmd = %s", command.c_str());
  Print("Applying update(s) please wait...");
  FlushConsole();
  const int result = HandleTAVToolReturnValue(RunInShell(command));
  if (result != kSuccess && result != kNoPayload) return 1;

  const std::string package_source = result == kNoPayload ? kNoPayloadMarker : repository_path;
  if (CopyTAVToRUVFoler(package_source, expansion_path, GetWorkingPath()) == 0) {
    PrintLine("Failed");
    DebugLog("[Status:]DecompressTAV: Failed to copy TAV to RUV Folder!");
    return 1;
  }
  PrintLine("Done");
  DebugLog("[Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!");
  return 0;
}

int TAVMaster::CopyTAVToRUVFoler(std::string package_source, std::string expansion_path, std::string working_path) {
  const TraceScope trace(*this, "CopyTAVToRUVFoler");
  const std::string script =
      expansion_path + kFileSeparator + "ruv" + kFileSeparator + "data" + kFileSeparator + COPYSCRIPT;
  if (!FileExist(script)) {
    DebugLog("[Status:]CopyTAVToRUVFoler: script file \"%s\" does not exist!", script.c_str());
    return 0;
  }
  chmod(script.c_str(), kCopyScriptMode);
  // The version and the trace file's path are bare; an empty version leaves two blanks in a row.
  std::string command = Quoted(script) + kSpaceSeparator + Quoted(expansion_path) + kSpaceSeparator +
                        Quoted(working_path) + kSpaceSeparator + Quoted(package_source) + kSpaceSeparator +
                        packageVersion + kSpaceSeparator + "1>>" + GetLogfileName() + kSpaceSeparator + "2>&1";
  FormatCommandString(command);
  DebugLog("[Status:]CopyTAVToRUVFoler: command = %s", command.c_str());
  RunInShell(command);
  return 1;
}

}  // namespace NZEMRUVTAV
