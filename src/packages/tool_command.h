#pragma once

#include <string>
#include <utility>

#include "launcher/command_fragments.h"
#include "launcher/tav.h"

namespace NZEMRUVTAV {

// The parts of a tavtool command line that differ between verbs; see ToolCommand. Paths are unquoted.
struct TAVMaster::ToolCall {
  ToolCall(std::string tool_verb, std::string path) : verb(std::move(tool_verb)), local_path(std::move(path)) {}

  std::string verb;
  std::string local_path;                  // value of "-l"
  std::string second_option;               // "-s" or "-t"; empty if the verb has no second path
  std::string second_path;                 // value of the second option
  std::string online_flags;                // flags of an online verb, which is also passed the forwarded arguments
  std::string redirection = OutputToNULL;  // of the tool's output
  bool program_quoted = true;              // only the expand command leaves the program's path bare
};

}  // namespace NZEMRUVTAV
