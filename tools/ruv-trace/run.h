// One run of the launcher, as its trace shows it.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ruv_trace {

struct Command {
  std::string text = "";
  bool cut = false;  // the end may be missing
};

struct ToolCall {
  std::string verb;
  Command command;
  std::optional<int> exit_code = {};
};

// The two ways in which a run ends without having done anything.
inline constexpr const char* kHelpShown = "help shown";
inline constexpr const char* kOptionsRejected = "options rejected";

// A field that the trace does not show is empty or "unknown". The words are those of ruv-trace(8).
struct Run {
  Run() = default;
  Run(unsigned long run_number, std::string file_name, unsigned long first_line)
      : number(run_number), file(std::move(file_name)), line(first_line) {}

  unsigned long number = 0;  // from 1; 0 for a verdict on the whole trace
  std::string file;
  unsigned long line = 0;  // of the first message, in the file

  // As the package tool got them or, without a call, as discovered.
  std::string machine_type, system, architecture;
  std::string mode = "unknown";
  std::vector<ToolCall> calls;
  std::string package = "unknown";
  std::string package_version;
  std::string copy_command;
  Command command;  // of the application
  std::string ruv = "unknown";

  std::string problem;                          // the first thing that failed
  std::string stopped = "its beginning is missing";  // where the messages end; empty for a complete run

  const std::string& Reason() const { return problem.empty() ? stopped : problem; }
  std::string Verdict() const {
    if (!problem.empty() || stopped.empty()) return problem.empty() ? "ok" : "problem";
    return stopped == kHelpShown || stopped == kOptionsRejected ? "none" : "unknown";
  }
};

// A message of the trace, without the launcher's prefix.
struct Message {
  std::string text;
  std::string more = "";  // the lines after it that are not messages, each after a line feed
};

inline constexpr const char* kFirstMessage = "[Debug:] Enter: TAVMaster::TAVMaster()";
inline constexpr const char* kLastMessage = "[Debug:] Exiting TAVMaster::~TAVMaster()";
// While this is a run's last message, the lines that follow are the copy script's output.
inline constexpr const char* kCopyScriptMessage = "[Status:]CopyTAVToRUVFoler: command = ";

// True if the message is the expected one. An expected text that ends with a blank, [ or " is followed by a value.
bool Matches(std::string_view message, std::string_view expected);
// Sets what the messages say about the run, and the messages that can come next: none after the last one. Returns false
// if the messages are not the beginning of a run's, in sequence.
bool Read(const std::vector<Message>& messages, Run& run, std::vector<std::string>& expected);

struct ToolOutcome {
  bool failed;
  std::string meaning;
  std::string package;  // its state afterwards; empty if the call does not change it
};
// Returns what an exit code of the package tool means. Finding no newer package is not a failure.
ToolOutcome OutcomeOf(const std::string& verb, int exit_code);
// Returns the first line of the launcher's message for an exit code, or "" if there is none.
std::string ErrorText(int exit_code);

}  // namespace ruv_trace
