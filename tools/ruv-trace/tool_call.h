#ifndef RUV_TRACE_TOOL_CALL_H
#define RUV_TRACE_TOOL_CALL_H

#include <optional>
#include <string>
#include <string_view>

#include "message.h"

namespace ruv_trace {

struct ToolCall {
  std::string verb = "unknown";
  std::optional<int> exit_code = {};  // nothing: the trace has none

  // What the launcher makes of the exit code: 0 success, 2 a package to install, 3 no payload, 1 everything else.
  int Result() const;

  // The exit code in a few words.
  std::string_view Meaning() const;
};

// Reads the verb off a command of the package tool, and the identity that it was given into used, as far as the command
// shows them: it may be cut.
ToolCall ParseToolCommand(std::string_view command, Identity& used);

}  // namespace ruv_trace

#endif  // RUV_TRACE_TOOL_CALL_H
