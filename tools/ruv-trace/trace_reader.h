// Puts the lines of a trace together to runs.
//
// The lines name no process, so launchers that run at the same time write into each other's runs. What is certain:
// - A run that begins while no other is unfinished, and whose lines all are next in turn to the end, is whole.
// - Of a run that is unfinished when the next begins, the lines until then are certain.
// - That next run may end with the lines of the unfinished one, if both got to the same point and one was killed there.
//   What it did before that point is certain.
// - As soon as a line is out of turn, nothing of the run is.
// A later run may also end with the lines of an unfinished one that took longer; its own lines then come afterwards.
// For that, runs are held back until some more have come to their end in turn.
#ifndef RUV_TRACE_TRACE_READER_H
#define RUV_TRACE_TRACE_READER_H

#include <cstddef>
#include <deque>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "run.h"

namespace ruv_trace {

class TraceReader {
 public:
  // report is called for each run, in the order in which they begin.
  explicit TraceReader(std::function<void(const Run&)> report) : report_(std::move(report)) {}

  // Goes on with another file. A run may have begun in the one before.
  void BeginFile(const std::string& name);
  // Takes the next line, without its line feed.
  void TakeLine(std::string_view line);
  // Reports the runs that are held back: the trace ends here.
  void End();

  // Whether the file holds a line of a run.
  bool FoundRuns() const { return found_runs_; }

 private:
  bool TakeMessage(std::string_view message);
  void TakeOutOfTurn(std::string_view message);
  void BeginRun();
  void EndRun();
  void Hold();
  void ReportFirst();

  std::function<void(const Run&)> report_;
  std::string file_;
  unsigned long line_ = 0;
  bool found_runs_ = false;
  unsigned long runs_ = 0;
  std::optional<Run> run_;         // the last one that began, until it ends
  std::optional<Run> left_;        // an unfinished one whose lines may be among those of the next
  unsigned long silent_ends_ = 0;  // runs just before run_ that may have ended without a message
  std::deque<Run> held_;           // the runs before run_, not reported yet
  unsigned long unfinished_ = 0;   // runs that may still go on, run_ included
  std::size_t in_turn_ = 0;        // runs that came to their end since a line was last out of turn
  std::string installed_;          // the command of the last copy script
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_TRACE_READER_H
