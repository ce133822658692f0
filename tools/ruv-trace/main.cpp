// ruv-trace: summarises the trace of the launcher.
#include <dirent.h>
#include <getopt.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <ctime>
#include <map>
#include <memory>

#include "log/trace_format.h"
#include "trace_reader.h"

namespace {
using namespace ruv_trace;

constexpr const char* kHelp =
    R"(Usage: ruv-trace [OPTION]... [FILE]...
Summarises the RUV launcher's trace, one line per run. Reads the FILEs in this
order, "-" being standard input; by default the trace, and before it the file
that the last rotation renamed.

  --problems        show only problems and runs whose outcome is unknown
  --long            also show each run's line number, full reason and commands
  --json            print one JSON object per run
  --check           judge the last run that launched or updated: one line, and
                    status 0 if it is ok, 2 if it is a problem, otherwise 3
  --max-age=DAYS    with --check: an older trace is a problem
  --show-passwords  show the passwords in commands
  -h, --help        show this text
  --version         show the version
See ruv-trace(8) for the meaning of each word of the output.
)";

// Statuses of --check, as monitoring systems understand them, and of a wrong command line.
enum ExitStatus : int { kOk = 0, kProblem = 2, kUnknown = 3, kUsageError = 64 };

using Strings = std::vector<std::string>;

struct {
  int json, with_details, problems_only, check, show_passwords;
  long max_age = -1;  // days; -1 is any
} options;

void Complain(const std::string& message) { std::fprintf(stderr, "ruv-trace: %s\n", Printable(message).c_str()); }

// Returns false, with a message, if the output could not be written.
bool Written() {
  if (std::fflush(stdout) == 0 && std::ferror(stdout) == 0) return true;
  Complain(std::string("cannot write: ") + std::strerror(errno));
  return false;
}

void Print(const Run& run) {
  static bool header_printed = false;
  std::string text = options.json != 0 ? JsonLine(run, options.show_passwords != 0) : CheckLine(run);
  if (options.json == 0 && options.check == 0) {
    text = (header_printed ? "" : kTableHeader) + TableLine(run);
    if (options.with_details != 0) text += Details(run, options.show_passwords != 0);
    header_printed = true;
  }
  std::fputs(text.c_str(), stdout);
}

// Reads a file of any size and content, in constant memory; "-" is standard input. What follows the last line feed is
// not a line. Sets written to the file's time if that is later and the file contains runs. Adds a complaint if the file
// is refused.
void ReadFile(const std::string& name, TraceReader& reader, std::time_t& written, Strings& complaints) {
  static const std::pair<std::string_view, const char*> kCompressors[] = {
      {"\x1F\x8B", "zcat"}, {"\xFD\x37zXZ", "xzcat"}, {"BZh", "bzcat"}, {"\x28\xB5\x2F\xFD", "zstdcat"}};
  constexpr std::size_t kLongestLine = 65536;
  constexpr std::size_t kKeptEnd = 1024;  // of a longer line; more than the launcher's longest one
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(name == "-" ? stdin : std::fopen(name.c_str(), "re"),
                                                             std::fclose);
  reader.BeginFile(name);
  bool empty = true, found = false;
  std::string line;
  std::vector<char> buffer(kLongestLine);
  for (std::size_t size = 0; file && (size = std::fread(buffer.data(), 1, buffer.size(), file.get())) > 0;) {
    std::string_view rest(buffer.data(), size);
    for (const auto& [magic, command] : kCompressors) {
      if (!empty || rest.substr(0, magic.size()) != magic) continue;
      return complaints.push_back(name + " is compressed: in bash, write <(" + command + " " + name + ") instead");
    }
    empty = false;
    for (std::size_t feed = 0; (feed = rest.find('\n')) != std::string_view::npos; rest.remove_prefix(feed + 1)) {
      found = reader.Take(line.append(rest, 0, feed)) || found;
      line.clear();
    }
    line.append(rest);
    if (line.size() > kLongestLine) line.erase(0, line.size() - kKeptEnd);
  }
  struct stat status = {};
  if (!file || std::ferror(file.get()) != 0) {
    const char* remedy = errno == EACCES ? "; root can" : "";
    complaints.push_back("cannot read " + name + ": " + std::strerror(errno) + remedy);
  } else if (found && fstat(fileno(file.get()), &status) == 0) {
    written = std::max(written, status.st_mtime);
  } else if (!empty) {
    complaints.push_back("no run of the launcher in " + name);
  }
}

// Returns the launcher's trace and, before it, the file that the last rotation renamed and has not compressed, if there
// is one: ruvtav.log.1 or, with logrotate's dateext, ruvtav.log-20260301. Then there may be no new file yet.
Strings DefaultFiles() {
  const std::string directory = NZEMRUVTAV::kLogDirectory, log = NZEMRUVTAV::kLogFile, trace = directory + "/" + log;
  std::pair<std::time_t, std::string> newest;
  struct stat status = {};
  DIR* const entries = opendir(directory.c_str());
  for (const dirent* entry = nullptr; entries != nullptr && (entry = readdir(entries)) != nullptr;) {
    const std::string name = entry->d_name, path = directory + "/" + name;
    if (name.size() <= log.size() || name.compare(0, log.size(), log) != 0) continue;
    const std::string rest = name.substr(log.size());
    if (rest != ".1" && (rest[0] != '-' || rest.find_first_not_of("-0123456789") != std::string::npos)) continue;
    if (stat(path.c_str(), &status) == 0) newest = std::max(newest, {status.st_mtime, path});
  }
  if (entries != nullptr) closedir(entries);
  if (newest.second.empty()) return {trace};
  return stat(trace.c_str(), &status) == 0 ? Strings{newest.second, trace} : Strings{newest.second};
}

// Prints the one line of --check, and returns the status. The complaint is about the first file that was refused.
int Check(const Run& last, const Run& last_look, const std::string& complaint, std::time_t written) {
  const bool look_counts = last.number == 0 || (last.Verdict() == "ok" && last_look.Verdict() != "ok");
  Run run = look_counts && last_look.number != 0 ? last_look : last;
  if (!complaint.empty()) run = Run();
  if (run.number == 0) run.stopped = complaint.empty() ? "no run that launched or updated" : complaint;
  const long days = static_cast<long>((std::time(nullptr) - written) / 86400);
  if (complaint.empty() && options.max_age >= 0 && days > options.max_age && run.problem.empty()) {
    run = Run();
    run.problem = "no run for " + std::to_string(days) + (days == 1 ? " day" : " days");
  }
  Print(run);
  return !Written() ? kUnknown : run.Verdict() == "ok" ? kOk : run.Verdict() == "problem" ? kProblem : kUnknown;
}

int Summarise(const Strings& names) {
  std::map<std::string, long> count;  // of each verdict
  Run last, last_look;  // that launched or updated, or may have; and that only looked for an update, since then
  TraceReader reader([&](const Run& run) {
    const std::string verdict = run.Verdict();
    ++count[verdict];
    if (options.check == 0 && (options.problems_only == 0 || (verdict != "ok" && verdict != "none"))) Print(run);
    if (verdict == "none") return;
    last_look = run.mode == "check" ? run : Run();
    if (run.mode != "check") last = run;
  });
  Strings complaints;
  std::time_t written = 0;
  for (const std::string& name : names) ReadFile(name, reader, written, complaints);
  reader.End();
  if (complaints.empty() && count.empty()) complaints.push_back("no run of the launcher in " + names.back());
  if (options.check != 0) return Check(last, last_look, complaints.empty() ? "" : complaints.front(), written);
  const long ok = count["ok"], problem = count["problem"], unknown = count["unknown"], none = count["none"];
  const long runs = ok + problem + unknown + none;
  if (options.json == 0 && runs > 0) {
    std::printf("%ld run%s: %ld ok, %ld problem, %ld unknown, %ld none\n", runs, runs == 1 ? "" : "s", ok, problem,
                unknown, none);
  }
  for (const std::string& complaint : complaints) Complain(complaint);
  return Written() && complaints.empty() ? EXIT_SUCCESS : EXIT_FAILURE;
}
}  // namespace

int main(int argc, char** argv) {
  // clang-format off
  const option long_options[] = {
      {"json", 0, &options.json, 1}, {"long", 0, &options.with_details, 1}, {"problems", 0, &options.problems_only, 1},
      {"check", 0, &options.check, 1}, {"max-age", 1, nullptr, 'a'},
      {"show-passwords", 0, &options.show_passwords, 1}, {"help", 0, nullptr, 'h'}, {"version", 0, nullptr, 'V'}, {}};
  // clang-format on
  for (int letter = 0; (letter = getopt_long(argc, argv, "h", long_options, nullptr)) != -1;) {
    if (letter == 'h' || letter == 'V') {
      std::fputs(letter == 'h' ? kHelp : "ruv-trace " RUV_VERSION "\n", stdout);
      return Written() ? EXIT_SUCCESS : EXIT_FAILURE;
    }
    const char* end = letter == 'a' ? optarg + std::strlen(optarg) : nullptr;
    const bool is_days = end != nullptr && std::from_chars(optarg, end, options.max_age).ptr == end;
    if (letter == 0 || (is_days && options.max_age >= 0)) continue;
    if (letter == 'a') Complain("--max-age needs a number of days");
    std::fputs("Try ruv-trace --help.\n", stderr);
    return kUsageError;
  }
  const Strings names(argv + optind, argv + argc);
  return Summarise(names.empty() ? DefaultFiles() : names);
}
