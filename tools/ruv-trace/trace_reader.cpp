#include "trace_reader.h"

#include <algorithm>
#include <sstream>

#include "log/trace_format.h"

namespace ruv_trace {
namespace {
constexpr std::size_t kMostFollowed = 20;   // an unfinished run with that many after it is given up
constexpr std::size_t kMostMessages = 500;  // of a run; an installing one has about forty
constexpr std::size_t kKeptText = 1024;     // of a message with the lines after it; more than a command

bool IsClosing(const std::string& message) {
  return message == kLastMessage || message == "[Debug:] Exiting TAVMaster::InvokeRUV()" ||
         message == "[Debug:] Exiting TAVMaster::TAVMasterMain()" ||
         message == "[Debug:] Entering TAVMaster::~TAVMaster()";
}
}  // namespace

bool TraceReader::Followed::Fits(const std::string& text) const {
  return messages.size() < kMostMessages &&
         std::any_of(expected.begin(), expected.end(), [&](const std::string& each) { return Matches(text, each); });
}

bool TraceReader::Take(const std::string& line) {
  ++line_;
  const std::string prefix = NZEMRUVTAV::kLinePrefix;
  // A copy script's output may lack a final line feed: then the launcher's message follows on the same line.
  const std::size_t position = line.compare(0, prefix.size(), prefix) == 0 ? 0 : line.rfind(prefix);
  if (position != 0) TakeOther(line.substr(0, position));
  if (position == std::string::npos) return false;
  const std::string text = line.substr(position + prefix.size());
  if (text == kFirstMessage) {
    CatchUp();
    Begin();
    collects_ = true;
  }
  if (!collects_) return TakeMessage(text);
  writer_->messages.push_back(text);
  if (text == kLastMessage || writer_->messages.size() == kMostMessages) CatchUp();
  return true;
}

// Reads the messages that were collected. If they are those of one run they are read once; if not, one after the other.
void TraceReader::CatchUp() {
  if (!collects_) return;
  collects_ = false;
  Followed& newest = followed_.back();
  if (newest.Read()) {
    for (const std::string& message : newest.messages) NoteRivals(newest, message);
  } else {
    const std::vector<std::string> messages = std::move(newest.messages);
    newest.messages.clear();
    newest.expected = {kFirstMessage};
    for (const std::string& message : messages) {
      std::istringstream lines(message);
      std::string line;
      std::getline(lines, line);
      for (TakeMessage(line); std::getline(lines, line);) TakeOther(line);
    }
  }
  ReportAllBut(kMostFollowed);
}

bool TraceReader::TakeMessage(const std::string& text) {
  const auto writer =
      std::find_if(followed_.rbegin(), followed_.rend(), [&](const Followed& each) { return each.Fits(text); });
  if (writer == followed_.rend()) return TakeStray(text);
  NoteRivals(*writer, text);
  if (!IsClosing(text) && !writer->rivals.empty()) writer->Mix();
  writer->messages.push_back(text);
  writer->Read();
  writer_ = &*writer;
  ReportAllBut(kMostFollowed);
  return true;
}

// Notes that the message, which goes to the writer, fits older runs as well.
void TraceReader::NoteRivals(Followed& writer, const std::string& text) {
  if (IsClosing(text)) return;
  for (Followed& older : followed_) {
    if (&older == &writer) return;
    if (older.Fits(text)) older.rivals.insert(&writer);
  }
}

// Takes a message that fits no run. Returns false if it is not one of the launcher's.
bool TraceReader::TakeStray(const std::string& text) {
  if (InCopyScript() != nullptr) {
    TakeOther(text);
    return true;
  }
  if (IsClosing(text)) return true;
  bool is_explained = false;
  for (Followed& each : followed_) {
    if (!each.expected.empty() && !each.messages.empty()) each.mixed = true;
    is_explained = is_explained || !each.expected.empty();
  }
  if (is_explained) return true;
  if (text.compare(0, 8, "[Debug:]") != 0 && text.compare(0, 9, "[Status:]") != 0) return false;
  Begin();
  followed_.back().expected = {kLastMessage};  // of a run whose beginning is missing
  return true;
}

// Takes a line without the launcher's prefix: a copy script's output, or the rest of a text with line feeds.
void TraceReader::TakeOther(const std::string& text) {
  Followed* writer = InCopyScript();
  if (writer == nullptr) writer = writer_;
  if (writer == nullptr || writer->messages.empty()) return;
  std::string& message = writer->messages.back();
  if (message.size() < kKeptText) message += "\n" + text.substr(0, kKeptText);
}

// Returns the newest run that is in its copy script, or null.
TraceReader::Followed* TraceReader::InCopyScript() {
  const auto run = std::find_if(followed_.rbegin(), followed_.rend(), [](const Followed& each) {
    return !each.messages.empty() && Matches(each.messages.back(), kCopyScriptMessage);
  });
  return run == followed_.rend() ? nullptr : &*run;
}

// Reports the runs before the oldest unfinished one, and enough others to follow no more than the limit.
void TraceReader::ReportAllBut(std::size_t limit) {
  while (!followed_.empty() && (followed_.front().expected.empty() || followed_.size() > limit)) {
    Followed& first = followed_.front();
    Run& run = first.run;
    if (!first.expected.empty()) first.Read();  // again, with the lines after its last message
    if (first.mixed) {
      run = Run(run.number, run.file, run.line);
      run.stopped = "mixed with another run, or lines are missing";
    }
    if (run.package == "copy_script_ran" && !run.package_version.empty()) {
      const std::string installation = run.machine_type + run.copy_command;
      if (installation == installed_ && run.problem.empty()) {
        run.problem = run.package_version + " installed again, or a version that begins with it";
      }
      installed_ = installation;
    } else if (run.package == "nothing_newer" && run.mode != "check") {
      installed_.clear();
    }
    report_(run);
    if (writer_ == &first) writer_ = nullptr;
    for (Followed& each : followed_) each.rivals.erase(&first);
    followed_.pop_front();
  }
}
}  // namespace ruv_trace
