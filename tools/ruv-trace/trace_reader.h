// Groups the lines of a trace into runs.
//
// The lines do not identify their process, so the lines of concurrent runs are mixed. These facts are certain:
// - A run that begins while no other is unfinished, and whose lines are all in sequence to the end, is complete.
// - If a run is unfinished when the next one begins, its lines up to that point are certain.
// - That next run may end with the lines of the unfinished one, if both reached the same point and one was killed
//   there. The lines before that point are certain.
// - As soon as a line is out of sequence, nothing about the run is certain.
// A later run may also end with the lines of an unfinished one that took longer; its own lines then follow. Therefore
// runs are held back until enough later runs have ended in sequence.
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

  // True if the file contains a line of a run.
  bool FoundRuns() const { return found_runs_; }

 private:
  bool TakeMessage(std::string_view message);
  void TakeOutOfTurn(std::string_view message);
  void DoubtAll();
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
  std::deque<Run> left_;           // unfinished ones whose lines may be among those of the next
  unsigned long silent_ends_ = 0;  // runs just before run_ that may have ended without a message
  std::deque<Run> held_;           // the runs before run_, not reported yet
  unsigned long unfinished_ = 0;   // runs that may still go on, run_ included
  std::size_t in_turn_ = 0;        // runs that came to their end since a line was last out of turn
  std::string installed_;          // the command of the last copy script
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_TRACE_READER_H
