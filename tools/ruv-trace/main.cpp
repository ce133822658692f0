// ruv-trace: summarises the trace of the launcher.
#include <getopt.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "input_file.h"
#include "log/trace_format.h"
#include "report.h"
#include "trace_reader.h"

namespace {

using namespace ruv_trace;

constexpr const char* kHelp =
    R"(Usage: ruv-trace [OPTION]... [FILE]...
Summarises the RUV launcher's trace, one line per run. Reads the FILEs in this
order, "-" being standard input; the default is %s.

  --problems        show only the runs that are not ok
  --long            also show each run's line number, full reason and commands
  --json            print one JSON object per run
  --check           judge the last run: one line, and status 0 if it is ok,
                    1 if it is a problem, 2 if unknown, 3 if there is none
  --show-passwords  show the passwords in commands
  -h, --help        show this text
  --version         show the version
See ruv-trace(8) for the meaning of each word of the output.
)";

enum ExitStatus : int { kSuccess, kProblemStatus, kUnknownStatus, kNoRun, kUsageError = 64 };

struct Options {
  bool json = false;
  bool with_details = false;
  bool problems_only = false;
  bool check = false;
  bool show_passwords = false;
};

void Complain(const std::string& message) { std::fprintf(stderr, "ruv-trace: %s\n", Printable(message).c_str()); }

// Returns false, with a message, if the output could not be written.
bool Written() {
  if (std::fflush(stdout) == 0 && std::ferror(stdout) == 0) return true;
  Complain(std::string("cannot write: ") + std::strerror(errno));
  return false;
}

// Prints runs as the options want them, and counts them.
class Printer {
 public:
  explicit Printer(const Options& options) : options_(options) {}

  void Take(const Run& run) {
    const std::string_view verdict = Judge(run).word;
    ++(verdict == kOk ? ok_ : verdict == kProblem ? problems_ : unknown_);
    if (options_.check) {
      last_ = run;
    } else if (!options_.problems_only || verdict != kOk) {
      Print(run);
    }
  }

  // Prints the totals or, with --check, the last run. Returns the exit status.
  ExitStatus Finish() const {
    const unsigned long runs = ok_ + problems_ + unknown_;
    if (options_.check) {
      if (!last_) return kNoRun;
      std::fputs((options_.json ? JsonLine(*last_, options_.show_passwords) : CheckLine(*last_)).c_str(), stdout);
      const std::string_view verdict = Judge(*last_).word;
      return verdict == kOk ? kSuccess : verdict == kProblem ? kProblemStatus : kUnknownStatus;
    }
    if (!options_.json && runs > 0) {
      std::printf("%lu run%s: %lu ok, %lu problem, %lu unknown\n", runs, runs == 1 ? "" : "s", ok_, problems_,
                  unknown_);
    }
    return kSuccess;
  }

 private:
  void Print(const Run& run) {
    if (options_.json) {
      std::fputs(JsonLine(run, options_.show_passwords).c_str(), stdout);
      return;
    }
    if (!header_printed_) std::fputs(TableHeader().c_str(), stdout);
    header_printed_ = true;
    std::fputs(TableLine(run).c_str(), stdout);
    if (options_.with_details) std::fputs(Details(run, options_.show_passwords).c_str(), stdout);
  }

  const Options options_;
  bool header_printed_ = false;
  unsigned long ok_ = 0;
  unsigned long problems_ = 0;
  unsigned long unknown_ = 0;
  std::optional<Run> last_;
};

// Reads the files. Returns false, with a message for each, if some were refused or all are empty.
bool ReadFiles(const std::vector<std::string>& names, TraceReader& reader) {
  bool all_read = true;
  bool found_runs = false;
  for (const std::string& name : names) {
    InputFile file(name);
    reader.BeginFile(name);
    for (std::string line; file.Next(line);) reader.TakeLine(line);
    found_runs = found_runs || reader.FoundRuns();
    const std::string refusal = file.Refusal(reader.FoundRuns());
    if (refusal.empty()) continue;
    Complain(refusal);
    all_read = false;
  }
  reader.End();
  if (all_read && !found_runs) Complain("no run of the launcher in " + names.back());
  return all_read && found_runs;
}

ExitStatus Summarise(const Options& options, const std::vector<std::string>& names) {
  Printer printer(options);
  TraceReader reader([&](const Run& run) { printer.Take(run); });
  const ExitStatus failure = options.check ? kNoRun : kProblemStatus;
  const bool all_read = ReadFiles(names, reader);
  if (options.check && !all_read) return failure;
  const ExitStatus status = printer.Finish();
  return Written() && all_read ? status : failure;
}

}  // namespace

int main(int argc, char** argv) {
  int json = 0;
  int with_details = 0;
  int problems_only = 0;
  int check = 0;
  int show_passwords = 0;
  const option long_options[] = {{"json", no_argument, &json, 1},
                                 {"long", no_argument, &with_details, 1},
                                 {"problems", no_argument, &problems_only, 1},
                                 {"check", no_argument, &check, 1},
                                 {"show-passwords", no_argument, &show_passwords, 1},
                                 {"help", no_argument, nullptr, 'h'},
                                 {"version", no_argument, nullptr, 'V'},
                                 {}};
  const std::string default_file = std::string(NZEMRUVTAV::kLogDirectory) + "/" + NZEMRUVTAV::kLogFile;

  for (int letter = 0; (letter = getopt_long(argc, argv, "h", long_options, nullptr)) != -1;) {
    switch (letter) {
      case 0:
        break;
      case 'h':
        std::printf(kHelp, default_file.c_str());
        return Written() ? EXIT_SUCCESS : EXIT_FAILURE;
      case 'V':
        std::puts("ruv-trace " RUV_VERSION);
        return Written() ? EXIT_SUCCESS : EXIT_FAILURE;
      default:
        std::fputs("Try ruv-trace --help.\n", stderr);
        return kUsageError;
    }
  }
  std::vector<std::string> names(argv + optind, argv + argc);
  if (names.empty()) names.push_back(default_file);
  return Summarise({json != 0, with_details != 0, problems_only != 0, check != 0, show_passwords != 0}, names);
}
