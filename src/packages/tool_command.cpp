#include "packages/tool_command.h"

namespace NZEMRUVTAV {

std::string TAVMaster::ToolCommand(const ToolCall& call) const {
  const std::string program = GetWorkingPath() + kFileSeparator + "tavtool";
  std::string command = call.program_quoted ? Quoted(program) : program;
  const auto append = [&command](const std::string& word) { command += kSpaceSeparator + word; };

  append(call.verb);
  append("-l");
  append(Quoted(call.local_path));
  if (!call.second_option.empty()) {
    append(call.second_option);
    append(Quoted(call.second_path));
  }
  append("-m");
  append(GetMachineType());
  append("-o");
  append(GetOperatingSystemType());
  append("-a");
  append(GetOperatingSystemArch());
  if (!call.online_flags.empty()) {
    append(call.online_flags);
    for (const std::string& argument : passThroughParams) append(argument);
  }
  append(call.redirection);
  FormatCommandString(command);
  return command;
}

}  // namespace NZEMRUVTAV
