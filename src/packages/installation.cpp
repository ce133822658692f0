// Expands the repository's package and installs it with the package's own copy script.
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

// Passed to the copy script as the package source if the tool found no payload.
constexpr const char* kNoPayloadMarker = "NO_TAV_PAYLOAD";

constexpr mode_t kCopyScriptMode = 0777;

// Results of CopyTAVToRUVFoler.
constexpr int kNoScript = 0;
constexpr int kScriptStarted = 1;

}  // namespace

int TAVMaster::DecompressTAV(std::string repository_path, std::string expansion_path) const {
  const TraceScope trace(*this, __func__);
  EnsureDirectory(repository_path);
  EnsureDirectory(expansion_path);
  ToolCall expansion(TAVTOOL_CMD_EXPAND, repository_path);
  expansion.second_option = "-t";
  expansion.second_path = expansion_path;
  expansion.program_quoted = false;
  const std::string command = ToolCommand(expansion);
  DebugLog("[Status:]DecompressTAV: TAVToolCmd = %s", command.c_str());
  Print("Applying update(s) please wait...");
  FlushConsole();
  const int result = HandleTAVToolReturnValue(RunInShell(command));
  if (result != kSuccess && result != kNoPayload) return kFailure;

  const std::string package_source = result == kNoPayload ? kNoPayloadMarker : repository_path;
  if (CopyTAVToRUVFoler(package_source, expansion_path, GetWorkingPath()) == kNoScript) {
    PrintLine("Failed");
    DebugLog("[Status:]DecompressTAV: Failed to copy TAV to RUV Folder!");
    return kFailure;
  }
  PrintLine("Done");
  DebugLog("[Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!");
  return kSuccess;
}

int TAVMaster::CopyTAVToRUVFoler(std::string package_source, std::string expansion_path,
                                 std::string working_path) const {
  const TraceScope trace(*this, __func__);
  const std::string script =
      expansion_path + kFileSeparator + "ruv" + kFileSeparator + "data" + kFileSeparator + COPYSCRIPT;
  if (!FileExist(script)) {
    DebugLog("[Status:]CopyTAVToRUVFoler: script file \"%s\" does not exist!", script.c_str());
    return kNoScript;
  }
  chmod(script.c_str(), kCopyScriptMode);
  // The version and the trace file's path are bare; an empty version leaves two consecutive blanks.
  std::string command = Quoted(script) + kSpaceSeparator + Quoted(expansion_path) + kSpaceSeparator +
                        Quoted(working_path) + kSpaceSeparator + Quoted(package_source) + kSpaceSeparator +
                        packageVersion + kSpaceSeparator + "1>>" + GetLogfileName() + kSpaceSeparator + "2>&1";
  FormatCommandString(command);
  DebugLog("[Status:]CopyTAVToRUVFoler: command = %s", command.c_str());
  RunInShell(command);
  return kScriptStarted;
}

}  // namespace NZEMRUVTAV
