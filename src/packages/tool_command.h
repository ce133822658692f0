#ifndef RUV_PACKAGES_TOOL_COMMAND_H
#define RUV_PACKAGES_TOOL_COMMAND_H

#include <string>

#include "launcher/command_fragments.h"
#include "launcher/tav.h"

namespace NZEMRUVTAV {

// What one verb puts into the shape that all tavtool commands share; ToolCommand turns it into the command line. Paths
// are given unquoted.
struct TAVMaster::ToolCall {
  std::string verb;
  std::string local_path;                  // value of "-l"
  std::string second_option;               // "-s" or "-t", or empty: the verb has no second path
  std::string second_path;                 // value of the second option
  std::string online_flags;                // flags of an online verb, which also gets the forwarded arguments
  std::string redirection = OutputToNULL;  // of the tool's output
  bool program_quoted = true;              // the expand command alone leaves the program's path bare
};

}  // namespace NZEMRUVTAV

#endif  // RUV_PACKAGES_TOOL_COMMAND_H
