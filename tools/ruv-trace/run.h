// One run of the launcher, as its trace shows it: how it is read, and how it is printed.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ruv_trace {
struct Command {
  std::string text;
  bool cut = false;           // the end may be missing
  std::size_t arguments = 0;  // where the user's arguments may begin
};

struct ToolCall {
  std::string verb;
  Command command;
  std::optional<int> exit_code = {};
  std::string result = "unknown", meaning = "no exit code";
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

  std::string problem;                               // the first thing that failed
  std::string stopped = "its beginning is missing";  // where the messages end; empty for a complete run

  const std::string& Reason() const { return problem.empty() ? stopped : problem; }
  std::string Verdict() const {
    if (!problem.empty() || stopped.empty()) return problem.empty() ? "ok" : "problem";
    return stopped == kHelpShown || stopped == kOptionsRejected ? "none" : "unknown";
  }
};

inline constexpr const char* kFirstMessage = "[Debug:] Enter: TAVMaster::TAVMaster()";
inline constexpr const char* kLastMessage = "[Debug:] Exiting TAVMaster::~TAVMaster()";
// While this is a run's last message, the lines that follow are the copy script's output.
inline constexpr const char* kCopyScriptMessage = "[Status:]CopyTAVToRUVFoler: command = ";

// True if the message is the expected one. An expected text that ends with a blank, [ or " is followed by a value.
bool Matches(std::string_view message, std::string_view expected);
// Sets what the messages say about the run, and the messages that can come next: none after the last one. A message
// contains also the lines after it that are not messages. Returns false if they are not the beginning of a run's.
bool Read(const std::vector<std::string>& messages, Run& run, std::vector<std::string>& expected);

// Sets what the call's exit code means, and returns the package's state afterwards, or "" if the call does not change
// it. Finding no newer package is not a failure.
std::string TakeExitCode(ToolCall& call, int exit_code);

inline constexpr const char* kTableHeader = "RUN VERDICT MACHINE DID    PACKAGE AND RUV, OR WHAT IS WRONG\n";
// Return the run's line in the table, of at most 80 characters; the indented lines that --long adds; the line of
// --check; the line of --json. All are in printable ASCII and end with a line feed.
std::string TableLine(const Run& run);
std::string Details(const Run& run, bool show_passwords);
std::string CheckLine(const Run& run);
std::string JsonLine(const Run& run, bool show_passwords);
// Returns the text with everything but printable ASCII escaped.
std::string Printable(const std::string& text);
}  // namespace ruv_trace
