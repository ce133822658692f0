// ruv-trace: summarises the trace of the launcher.
#include <getopt.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <map>
#include <memory>
#include <regex>

#include "log/trace_format.h"
#include "report.h"
#include "trace_reader.h"

namespace {

using namespace ruv_trace;
namespace fs = std::filesystem;

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

struct {
  int json, with_details, problems_only, check, show_passwords;
  long max_age = -1;  // days; -1 is any
} options;

void Complain(const std::string& message) { std::fprintf(stderr, "ruv-trace: %s\n", Printable(message).c_str()); }

std::string Counted(long count, const std::string& what) {
  return std::to_string(count) + " " + what + (count == 1 ? "" : "s");
}

// Returns false, with a message, if the output could not be written.
bool Written() {
  if (std::fflush(stdout) == 0 && std::ferror(stdout) == 0) return true;
  Complain(std::string("cannot write: ") + std::strerror(errno));
  return false;
}

void Print(const Run& run) {
  static bool header_printed = false;
  if (options.json != 0) {
    std::fputs(JsonLine(run, options.show_passwords != 0).c_str(), stdout);
  } else if (options.check != 0) {
    std::fputs(CheckLine(run).c_str(), stdout);
  } else {
    if (!header_printed) std::fputs(TableHeader().c_str(), stdout);
    header_printed = true;
    std::fputs(TableLine(run).c_str(), stdout);
    if (options.with_details != 0) std::fputs(Details(run, options.show_passwords != 0).c_str(), stdout);
  }
}

// What is kept of all runs.
struct Summary {
  std::map<std::string, long> count;  // of each verdict
  Run last, last_look;                // that launched or updated, or may have; and that only looked for an update since

  void Take(const Run& run) {
    ++count[run.Verdict()];
    if (run.Verdict() == "none") return;
    last_look = run.mode == "check" ? run : Run();
    if (run.mode != "check") last = run;
  }

  // Returns the run that --check judges: the last one that launched or updated or, if there is none or it is ok and the
  // later look for an update is not, that look.
  const Run& Judged() const {
    const bool look_counts = last.number == 0 || (last.Verdict() == "ok" && last_look.Verdict() != "ok");
    return look_counts && last_look.number != 0 ? last_look : last;
  }
};

// Reads a file of any size and content, in constant memory; "-" is standard input. What follows the last line feed is
// not a line. Sets written to the file's time if that is later and the file contains runs. Returns why the file is
// refused, or "".
std::string ReadFile(const std::string& name, TraceReader& reader, std::time_t& written) {
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
      return name + " is compressed: in bash, write <(" + command + " " + name + ") instead";
    }
    empty = false;
    for (std::size_t feed = 0; (feed = rest.find('\n')) != std::string_view::npos; rest.remove_prefix(feed + 1)) {
      found = reader.Take(line.append(rest, 0, feed)) || found;
      line.clear();
    }
    line.append(rest);
    if (line.size() > kLongestLine) line.erase(0, line.size() - kKeptEnd);
  }
  if (!file || std::ferror(file.get()) != 0) {
    return "cannot read " + name + ": " + std::strerror(errno) + (errno == EACCES ? "; root can" : "");
  }
  struct stat status = {};
  if (found && fstat(fileno(file.get()), &status) == 0) written = std::max(written, status.st_mtime);
  return found || empty ? "" : "no run of the launcher in " + name;
}

// Returns the launcher's trace and, before it, the file that the last rotation renamed and has not compressed, if there
// is one: ruvtav.log.1 or, with logrotate's dateext, ruvtav.log-20260301.
std::vector<std::string> DefaultFiles() {
  const fs::path trace = fs::path(NZEMRUVTAV::kLogDirectory) / NZEMRUVTAV::kLogFile;
  const std::regex rotated(NZEMRUVTAV::kLogFile + std::string("(\\.1|-[0-9-]+)"));
  std::error_code ignored;
  std::pair<fs::file_time_type, std::string> newest = {fs::file_time_type::min(), ""};
  for (const fs::directory_entry& entry : fs::directory_iterator(trace.parent_path(), ignored)) {
    if (!std::regex_match(entry.path().filename().string(), rotated)) continue;
    newest = std::max(newest, {entry.last_write_time(ignored), entry.path()});
  }
  if (newest.second.empty()) return {trace};
  // After a rotation there is no new file until the next run.
  return fs::exists(trace, ignored) ? std::vector<std::string>{newest.second, trace} : std::vector{newest.second};
}

// Prints the one line of --check, and returns the status. The complaint is about the first file that was refused.
int Check(const Run& last, const std::string& complaint, std::time_t written) {
  Run judged;
  judged.stopped = complaint.empty() ? "no run that launched or updated" : complaint;
  if (complaint.empty() && last.number != 0) judged = last;
  const long days = static_cast<long>((std::time(nullptr) - written) / 86400);
  if (complaint.empty() && options.max_age >= 0 && days > options.max_age && judged.problem.empty()) {
    judged = {};
    judged.problem = "no run for " + Counted(days, "day");
  }
  Print(judged);
  if (!Written()) return kUnknown;
  return judged.Verdict() == "ok" ? kOk : judged.Verdict() == "problem" ? kProblem : kUnknown;
}

int Summarise(const std::vector<std::string>& names) {
  Summary summary;
  TraceReader reader([&](const Run& run) {
    summary.Take(run);
    const bool is_fine = run.Verdict() == "ok" || run.Verdict() == "none";
    if (options.check == 0 && (options.problems_only == 0 || !is_fine)) Print(run);
  });
  std::vector<std::string> complaints;
  std::time_t written = 0;
  for (const std::string& name : names) {
    const std::string complaint = ReadFile(name, reader, written);
    if (!complaint.empty()) complaints.push_back(complaint);
  }
  reader.End();
  if (complaints.empty() && written == 0) complaints.push_back("no run of the launcher in " + names.back());
  if (options.check != 0) return Check(summary.Judged(), complaints.empty() ? "" : complaints.front(), written);
  std::string total;
  long runs = 0;
  for (const char* verdict : {"ok", "problem", "unknown", "none"}) {
    runs += summary.count[verdict];
    total += (total.empty() ? ": " : ", ") + std::to_string(summary.count[verdict]) + " " + verdict;
  }
  if (options.json == 0 && runs > 0) std::puts((Counted(runs, "run") + total).c_str());
  for (const std::string& complaint : complaints) Complain(complaint);
  return Written() && complaints.empty() ? EXIT_SUCCESS : EXIT_FAILURE;
}

}  // namespace

int main(int argc, char** argv) {
  const option long_options[] = {{"json", no_argument, &options.json, 1},
                                 {"long", no_argument, &options.with_details, 1},
                                 {"problems", no_argument, &options.problems_only, 1},
                                 {"check", no_argument, &options.check, 1},
                                 {"show-passwords", no_argument, &options.show_passwords, 1},
                                 {"max-age", required_argument, nullptr, 'a'},
                                 {"help", no_argument, nullptr, 'h'},
                                 {"version", no_argument, nullptr, 'V'},
                                 {}};
  for (int letter = 0; (letter = getopt_long(argc, argv, "h", long_options, nullptr)) != -1;) {
    switch (letter) {
      case 0:
        break;
      case 'h':
        std::fputs(kHelp, stdout);
        return Written() ? EXIT_SUCCESS : EXIT_FAILURE;
      case 'V':
        std::puts("ruv-trace " RUV_VERSION);
        return Written() ? EXIT_SUCCESS : EXIT_FAILURE;
      case 'a':
        if (*std::from_chars(optarg, optarg + std::strlen(optarg), options.max_age).ptr == '\0' && options.max_age >= 0)
          break;
        Complain(std::string("not a number of days: ") + optarg);
        [[fallthrough]];
      default:
        std::fputs("Try ruv-trace --help.\n", stderr);
        return kUsageError;
    }
  }
  const std::vector<std::string> names(argv + optind, argv + argc);
  return Summarise(names.empty() ? DefaultFiles() : names);
}
