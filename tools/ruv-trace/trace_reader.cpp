#include "trace_reader.h"

#include <algorithm>
#include <optional>

#include "log/trace_format.h"

namespace ruv_trace {
namespace {

constexpr std::string_view kPrefix = NZEMRUVTAV::kLinePrefix;

}  // namespace

void TraceReader::Take(std::string_view line) {
  ++line_number_;
  const bool prefixed = line.compare(0, kPrefix.size(), kPrefix) == 0;
  std::optional<Message> message = prefixed ? ParseMessage(line.substr(kPrefix.size())) : std::nullopt;
  if (!message) {
    // Behind what was written without a line feed, such as the copy script's last words, stands the launcher's line.
    const std::size_t prefix = line.rfind(kPrefix);
    if (prefix != std::string_view::npos && prefix > 0) message = ParseMessage(line.substr(prefix + kPrefix.size()));
  }
  if (message) {
    TakeMessage(*message);
  } else if (!prefixed && !runs_.empty()) {
    runs_.back().TakeContinuation(line);
  }
}

void TraceReader::End() {
  while (!runs_.empty()) ReportFirst();
}

void TraceReader::TakeMessage(const Message& message) {
  if (message.kind == Kind::kBegin) return NewRun().Take(message);
  Run* const run = RunOf(message);
  if (run == nullptr) return;
  run->Take(message);
  if (!run->Finished()) return;
  while (!runs_.empty() && runs_.front().Finished()) ReportFirst();
}

// Returns null for what is no line of the launcher's.
Run* TraceReader::RunOf(const Message& message) {
  for (auto run = runs_.rbegin(); run != runs_.rend(); ++run) {
    if (!run->Expects(message)) continue;
    // An older run that goes on was there all the time, so that any line which both expected may be the other's.
    if (run != runs_.rbegin()) std::for_each(runs_.rbegin(), run + 1, [](Run& each) { each.mixed = true; });
    return &*run;
  }
  // Nobody expects it: lines are missing before it, or a copy script writes what looks like the launcher's.
  if (runs_.empty() || runs_.back().Finished()) return &NewRun();
  return runs_.back().RunsCopyScript() ? nullptr : &runs_.back();
}

Run& TraceReader::NewRun() {
  if (runs_.size() == kMostRunsHeld) ReportFirst();
  return runs_.emplace_back(++runs_begun_, line_number_);
}

void TraceReader::ReportFirst() {
  report_(runs_.front());
  runs_.pop_front();
}

}  // namespace ruv_trace
