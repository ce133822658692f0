// Groups the lines of a trace into runs.
//
// The lines do not name their process. A run is followed until it is complete or twenty others have begun after it. A
// message goes to the newest unfinished one that it fits.
// - If it fits an older one as well, it may be that one's. If the older one was killed, nothing is wrong with that. But
//   if it writes another message later, both are mixed: what each of them did is not known.
// - A message that fits no run shows that some are missing: the unfinished runs are mixed, and no others.
// - The messages after the application's end are the same in all runs: they mix no runs, and mean nothing if they fit
//   none.
//
// What this design gives up: if one of several overlapping runs is killed where another one's later messages fit it, it
// may be taken for complete. That is rare: unattended runs take a lock. A complete run is never judged by another one's
// messages.
#pragma once

#include <functional>
#include <list>
#include <set>
#include <string>
#include <vector>

#include "run.h"

namespace ruv_trace {
class TraceReader {
 public:
  // report is called for each run, in the order in which they begin.
  explicit TraceReader(std::function<void(const Run&)> report) : report_(std::move(report)) {}

  // Goes on with another file. A run may have begun in the one before.
  void BeginFile(const std::string& name) { file_ = name, line_ = 0; }
  // Takes the next line, without its line feed. Returns true if it contains a message of a run.
  bool Take(const std::string& line);
  // Reports the runs that are followed: the trace ends here.
  void End() { CatchUp(), ReportAllBut(0); }

 private:
  struct Followed {
    Run run;
    std::vector<std::string> messages = {};
    std::vector<std::string> expected = {kFirstMessage};  // next; nothing after the last message
    bool mixed = false;
    std::set<Followed*> rivals = {};  // newer runs with messages that may be this one's

    bool Read() {
      run = Run(run.number, run.file, run.line);
      return ruv_trace::Read(messages, run, expected);
    }
    void Mix() {
      mixed = true;
      for (Followed* rival : rivals) rival->mixed = true;
    }
    bool Fits(const std::string& text) const;
  };

  void Begin() {
    followed_.push_back({Run(++runs_, file_, line_)});
    writer_ = &followed_.back();
  }
  void CatchUp();
  bool TakeMessage(const std::string& text);
  bool TakeStray(const std::string& text);
  void TakeOther(const std::string& text);
  Followed* InCopyScript();
  void NoteRivals(Followed& writer, const std::string& text);
  void ReportAllBut(std::size_t limit);

  std::function<void(const Run&)> report_;
  std::string file_;
  unsigned long line_ = 0, runs_ = 0;
  std::list<Followed> followed_;  // the runs since the oldest unfinished one
  Followed* writer_ = nullptr;    // of the last message
  bool collects_ = false;         // the last run's messages are read later, all at once
  std::string installed_;         // what the last copy script installed
};
}  // namespace ruv_trace
