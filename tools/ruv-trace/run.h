// What the trace tells of one run of the launcher.
#ifndef RUV_TRACE_RUN_H
#define RUV_TRACE_RUN_H

#include <string>
#include <string_view>
#include <vector>

#include "message.h"
#include "tool_call.h"

namespace ruv_trace {

class Run {
 public:
  // Both count from 1; the line is the one with which the run begins.
  Run(unsigned long run_number, unsigned long first_line) : number(run_number), line(first_line) {}

  unsigned long number;
  unsigned long line;
  Identity discovered;  // at the start
  Identity used;        // by the package tool's commands, which the command line may have given another one
  std::vector<ToolCall> calls;
  std::string_view package;  // what became of the repository's package; empty when none was expanded
  std::string package_version;
  std::string command;       // of the application
  bool command_cut = false;  // the launcher's trace keeps so much of a message and no more
  bool mixed = false;        // with the lines of another run
  bool lines_missing = false;

  // Whether the message is one that can come next.
  bool Expects(const Message& message) const;
  // Whatever was expected: a message that was not is one behind lines that are missing.
  void Take(const Message& message);
  // Takes a line that no launcher's prefix begins: the rest of the application's command when that has just begun and
  // an argument holds a line feed.
  void TakeContinuation(std::string_view text);

  bool Finished() const { return finished_; }
  // What others write into the trace then is the copy script's output.
  bool RunsCopyScript() const { return in_copy_script_; }

  // "launch", "check", "update", "check or update", or empty when it came to neither or the trace does not tell.
  std::string_view Mode() const;
  // "started", "not started", "started or declined", or "unknown". The command is in the trace before the question is
  // asked, and the answer is not.
  std::string_view Application() const;
  std::string_view Ended() const;

 private:
  bool Entered(Member member) const { return (entered_ >> member & 1U) != 0; }
  bool LacksItsCommand() const;
  void AddCall(const ToolCall& call);
  void TakeToolExit(int exit_code);
  void TakeCommand(std::string_view text);
  bool CannotHaveAsked() const;

  Member where_ = kOutside;
  Kind last_kind_ = Kind::kBegin;
  Member last_member_ = kOutside;
  unsigned entered_ = 0;  // a bit for each member
  bool portable_tested_ = false;
  bool awaits_tool_exit_ = false;
  bool in_copy_script_ = false;
  bool finished_ = false;
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_RUN_H
