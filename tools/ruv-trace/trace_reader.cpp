#include "trace_reader.h"

#include "log/trace_format.h"

namespace ruv_trace {
namespace {

constexpr std::string_view kPrefix = NZEMRUVTAV::kLinePrefix;

// After this many runs have ended in sequence, an unfinished one is assumed to have been killed.
constexpr std::size_t kMostHeld = 20;

constexpr std::string_view kMixed = "mixed with another run, or lines are missing";
constexpr std::string_view kHeadless = "its beginning is missing";

}  // namespace

void TraceReader::BeginFile(const std::string& name) {
  file_ = name;
  line_ = 0;
  found_runs_ = false;
}

void TraceReader::TakeLine(std::string_view line) {
  ++line_;
  const bool prefixed = line.substr(0, kPrefix.size()) == kPrefix;
  if (prefixed && TakeMessage(line.substr(kPrefix.size()))) return;
  // A copy script's output may lack a final line feed: then the launcher's line follows on the same line.
  const std::size_t position = line.rfind(kPrefix);
  const bool inside = position != std::string_view::npos && position > 0;
  if (inside && TakeMessage(line.substr(position + kPrefix.size()))) return;
  if ((prefixed || inside) && !(run_ && run_->RunsCopyScript())) {
    TakeOutOfTurn(line.substr(position + kPrefix.size()));
  } else if (run_) {
    run_->TakeOther(line);
  }
}

// Returns false if the message is not the next one of the run.
bool TraceReader::TakeMessage(std::string_view message) {
  if (message == kFirstMessage) {
    BeginRun();
  } else if (run_ && !run_->IsMixed() && run_->Take(message)) {
    if (run_->Finished()) EndRun();
  } else {
    return false;
  }
  found_runs_ = true;
  return true;
}

void TraceReader::BeginRun() {
  const bool others_unfinished = unfinished_ > 0;
  const bool silent_end = run_ && run_->MayHaveEnded() && !run_->IsMixed();
  silent_ends_ = silent_end ? silent_ends_ + 1 : 0;
  if (run_ && !silent_end) {
    // The lines after the application's end are the same in all runs: nothing of the next run can be taken for them.
    if (run_->IsDoubtful() || !run_->RunsApplication()) left_.push_back(*run_);
    if (left_.size() > kMostHeld) left_.pop_front();
    in_turn_ = 0;
  }
  if (run_) Hold();
  run_.emplace(++runs_, file_, line_);
  run_->Take(kFirstMessage);
  run_->others_unfinished = others_unfinished;
  for (const Run& left : left_) run_->BeginBeforeEndOf(left);
  ++unfinished_;
}

void TraceReader::EndRun() {
  unfinished_ -= 1 + silent_ends_;
  silent_ends_ = 0;
  if (run_->IsDoubtful()) left_.clear();
  if (++in_turn_ == kMostHeld) {
    left_.clear();
    unfinished_ = 0;
  }
  Hold();
}

// Takes a message that is not the next one of the run: it is another run's, or some are missing before it.
void TraceReader::TakeOutOfTurn(std::string_view message) {
  if (!run_ && !Run::Knows(message)) return;
  const bool others_unfinished = unfinished_ > (run_ ? 1 : 0);
  // The last lines of a run that was in the application meanwhile say nothing about others.
  if (!Run::Closes(message) || (run_ && (!others_unfinished || run_->Finished()))) {
    DoubtAll();
    found_runs_ = true;
  }
  if (message != kLastMessage || unfinished_ == 0 || --unfinished_ > 0) return;
  left_.clear();
  if (run_) Hold();
}

// Nothing is certain of the run, nor of those since an unfinished one: they may have ended with its lines.
void TraceReader::DoubtAll() {
  in_turn_ = 0;
  if (run_) {
    run_->Doubt(kMixed);
  } else if (unfinished_ == 0) {
    ++unfinished_;
    run_.emplace(++runs_, file_, line_);
    run_->Doubt(kHeadless);
  }
  for (Run& each : held_) {
    if (each.others_unfinished) each.Doubt(kMixed);
  }
}

void TraceReader::Hold() {
  held_.push_back(std::move(*run_));
  run_.reset();
  if (held_.size() > kMostHeld) ReportFirst();
}

void TraceReader::ReportFirst() {
  Run& run = held_.front();
  const Facts& known = run.Known();
  if (known.package == kCopyScriptRan && !known.copy_command.MayBeCut()) {
    run.installed_again = known.copy_command.text == installed_ && !known.package_version.empty();
    installed_ = known.copy_command.text;
  } else if (known.package == kNothingNewer && known.mode != kCheckMode) {
    installed_.clear();
  }
  report_(run);
  held_.pop_front();
}

void TraceReader::End() {
  if (run_) Hold();
  while (!held_.empty()) ReportFirst();
}

}  // namespace ruv_trace
