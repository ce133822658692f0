#ifndef RUV_TRACE_TRACE_READER_H
#define RUV_TRACE_TRACE_READER_H

#include <deque>
#include <functional>
#include <string_view>
#include <utility>

#include "message.h"
#include "run.h"

namespace ruv_trace {

// Puts the lines of a trace together to runs, and reports the runs in the order in which they begin.
//
// The lines name no process. Launchers that run at the same time are told apart by what can come next in each run: a
// line belongs to the newest run that expects it. A run that is unfinished when another begins is held back with those
// behind it, since it may go on: a few runs and no more, so that a run cut short long ago holds nothing up.
class TraceReader {
 public:
  explicit TraceReader(std::function<void(const Run&)> report) : report_(std::move(report)) {}

  // Takes the next line, without its line feed.
  void Take(std::string_view line);

  // Reports what is held back: the trace ends here.
  void End();

 private:
  static constexpr std::size_t kMostRunsHeld = 8;

  void TakeMessage(const Message& message);
  Run* RunOf(const Message& message);
  Run& NewRun();
  void ReportFirst();

  std::function<void(const Run&)> report_;
  std::deque<Run> runs_;
  unsigned long runs_begun_ = 0;
  unsigned long line_number_ = 0;
};

}  // namespace ruv_trace

#endif  // RUV_TRACE_TRACE_READER_H
