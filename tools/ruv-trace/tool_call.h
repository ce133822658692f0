// A call of the package tool, as the trace shows it.
#ifndef RUV_TRACE_TOOL_CALL_H
#define RUV_TRACE_TOOL_CALL_H

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace ruv_trace {

struct Identity {
  std::optional<std::string> machine_type;
  std::optional<std::string> system;
  std::optional<std::string> architecture;
};

// A traced command. The launcher cuts a message at 511 bytes: with no room left, the end may be missing.
struct Command {
  std::string text;
  std::size_t room = 0;  // bytes that the message could have been longer

  bool MayBeCut() const { return room == 0; }
};

// States of the package after a tool call; see the manual page.
inline constexpr std::string_view kNothingNewer = "nothing_newer";
inline constexpr std::string_view kAvailable = "available";
inline constexpr std::string_view kCheckFailed = "check_failed";
inline constexpr std::string_view kDownloaded = "downloaded";
inline constexpr std::string_view kDownloadFailed = "download_failed";
inline constexpr std::string_view kExpanded = "expanded";
inline constexpr std::string_view kExpansionFailed = "expansion_failed";

// Returns the first line of the launcher's message for an exit code, or "" if there is none.
std::string_view ErrorText(int exit_code);

struct ToolCall {
  std::string verb;
  Command command;
  std::optional<int> exit_code = {};  // empty if not in the trace

  // True if the exit code reports a failure. Finding no newer package is not one.
  bool Failed() const;
  // Returns the exit code's meaning in words.
  std::string_view Meaning() const;
  // Returns the package's state after the call, or "" if the call does not change it. There must be an exit code.
  std::string_view Package() const;
  // Sets the machine type, operating system and architecture that the command contains.
  void ReadIdentity(Identity& identity) const;
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_TOOL_CALL_H
