// One message of the trace, as far as ruv-trace has a use for it.
#ifndef RUV_TRACE_MESSAGE_H
#define RUV_TRACE_MESSAGE_H

#include <optional>
#include <string>
#include <string_view>

namespace ruv_trace {

// The launcher's members that trace their entry and exit; kOutside is none of them.
enum Member {
  kOutside,
  kSession,
  kOwnDirectory,
  kSystemCode,
  kSupportList,
  kDriver,
  kOptions,
  kImport,
  kCheck,
  kDownload,
  kComparison,
  kExpansion,
  kCopying,
  kLaunch,
  kSessionEnd,
};

// The member that calls it, and what is to be said of a run whose trace goes no further than into it.
Member CallerOf(Member member);
std::string_view EndedIn(Member member);

struct Identity {
  std::optional<std::string> machine_type;
  std::optional<std::string> system;
  std::optional<std::string> architecture;
};

enum class Kind {
  kBegin,               // of a run
  kEntry,               // into the member
  kExit,                // from the member
  kIdentity,            // text: the field's value
  kPortableTest,        // whether the installation is portable
  kToolCommand,         // text: the command
  kToolExit,            // exit_code
  kCopyCommand,         // text: the copy script's command
  kNoCopyScript,        // the package brought none
  kCopied,              // the copy script was run
  kApplicationCommand,  // text: the command
};

struct Message {
  Kind kind;
  Member member = kOutside;  // that wrote it; kOutside for kToolExit, which several write
  std::string_view text = {};
  std::optional<std::string> Identity::*field = nullptr;
  int exit_code = 0;
};

// Takes a line behind its prefix. Returns nothing for the many messages that say nothing about the run's course, and
// for what no launcher writes.
std::optional<Message> ParseMessage(std::string_view line);

}  // namespace ruv_trace

#endif  // RUV_TRACE_MESSAGE_H
