// One run of the launcher as its trace shows it.
#ifndef RUV_TRACE_RUN_H
#define RUV_TRACE_RUN_H

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "tool_call.h"

namespace ruv_trace {

// The words of the JSON output; see the manual page.
inline constexpr std::string_view kUnknown = "unknown";
inline constexpr std::string_view kLaunchMode = "launch";
inline constexpr std::string_view kCheckMode = "check";
inline constexpr std::string_view kUpdateMode = "update";
inline constexpr std::string_view kNotChecked = "not_checked";
inline constexpr std::string_view kNoCopyScriptFound = "no_copy_script";
inline constexpr std::string_view kCopyScriptNotRun = "copy_script_not_run";
inline constexpr std::string_view kCopyScriptRan = "copy_script_ran";
inline constexpr std::string_view kStarted = "started";
inline constexpr std::string_view kStartedOrDeclined = "started_or_declined";
inline constexpr std::string_view kNotStarted = "not_started";

// The messages that begin and end a run.
inline constexpr std::string_view kFirstMessage = "[Debug:] Enter: TAVMaster::TAVMaster()";
inline constexpr std::string_view kLastMessage = "[Debug:] Exiting TAVMaster::~TAVMaster()";

// What the lines of a run say.
struct Facts {
  Identity discovered;  // by the launcher
  Identity used;        // on the package tool's command lines
  std::string_view mode = kUnknown;
  std::vector<ToolCall> calls;          // of the package tool
  std::string_view package = kUnknown;  // its state at the end
  std::string package_version;          // empty if not in the trace
  Command copy_command;                 // of the package's copy script
  unsigned long copy_output_lines = 0;  // of the copy script
  std::string shell_complaint;          // why the shell could not run the copy script
  bool portable = false;                // the installation
  bool no_question = false;             // the user was not asked whether to go on
  Command command;                      // of the application
  std::string_view application = kUnknown;
  std::string option_without_value;
};

class Run {
 public:
  // Both numbers count from 1; the line is the run's first one in its file.
  Run(unsigned long run_number, std::string file_name, unsigned long first_line)
      : number(run_number), file(std::move(file_name)), line(first_line) {}

  unsigned long number;
  std::string file;
  unsigned long line;
  bool installed_again = false;    // the last installation was of the same package
  bool others_unfinished = false;  // when this run began

  // Takes a message of the trace. Returns false if no launcher writes it at this point of a run.
  bool Take(std::string_view message);
  // Takes a line without the launcher's prefix: copy-script output, or the rest of a command with a line feed in it.
  void TakeOther(std::string_view text);
  // Marks everything after the point where the other run stopped as uncertain.
  void BeginBeforeEndOf(const Run& other);
  // Discards all facts, because a line is out of sequence.
  void Doubt(std::string_view reason);

  bool IsMixed() const { return !doubt_.empty(); }
  // True if later lines may be those of an unfinished run.
  bool IsDoubtful() const { return frozen_; }
  bool Finished() const;
  bool RunsCopyScript() const;
  // True if the application runs, or the question before it is open.
  bool RunsApplication() const;
  // True if the launcher can end here without a message: after the help text, with rejected options, and without its
  // own directory.
  bool MayHaveEnded() const;

  // Returns what is certain.
  const Facts& Known() const { return facts_; }
  // Returns the identity on the package tool's command line or, without one, the discovered one.
  Identity Machine() const;
  // Returns what failed, or "" if nothing is known to have failed.
  std::string Problem() const;
  // Returns why the trace does not show the run's outcome, or "" if it does.
  std::string Unclear() const;

  // True if some launcher writes the message at some point.
  static bool Knows(std::string_view message);
  // True if the message is one of those after the application's end, which are the same in all runs.
  static bool Closes(std::string_view message);

 private:
  struct Message;
  static const Message kMessages[];

  // Ids of messages.
  static constexpr char kOwnDirectory = 'B';
  static constexpr char kHelper = 'D';
  static constexpr char kOptions = 'Q';
  static constexpr char kUnknownOption = 'R';
  static constexpr char kOptionsLeft = 'S';
  static constexpr char kCopyScript = 'o';
  static constexpr char kApplication = 'y';
  static constexpr char kEnd = '5';

  // Returns the id of the last message, or 0.
  char Last() const;
  const Message* Next(std::string_view message) const;
  bool TakeExitCode(std::string_view message);

  const Message* last_ = nullptr;
  bool awaits_exit_code_ = false;  // of the package tool
  std::string_view error_text_due_;
  std::vector<const Message*> doubtful_after_;
  unsigned long run_before_ = 0;  // the unfinished one
  bool frozen_ = false;           // nothing more is certain
  Facts facts_;
  std::string_view doubt_;
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_RUN_H
