// ruv-trace: what the launcher's trace tells of its runs, one line each.
#include <fcntl.h>
#include <getopt.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

#include "line_source.h"
#include "log/trace_format.h"
#include "report.h"
#include "trace_reader.h"

namespace {

using namespace ruv_trace;

constexpr int kUsageError = 2;

constexpr const char* kHelp =
    R"(Usage: ruv-trace [--json] [FILE]...
Tells what the runs of the RUV launcher did, one line a run, from its trace:
the FILEs, "-" for standard input, or %s.

  --json      one JSON object a run (JSON Lines)
  -h, --help  show this text
  --version   show the version

A line shows, where the trace does:
- the number of the run, and the line of the file where it begins;
- the machine type, operating system and architecture, as found on the machine
  or, where it differs, as given to tavtool;
- what it did: launch, check or update;
- each call of tavtool with its exit code and what that means (under some
  shells the code is 0 also when a signal ended tavtool);
- the package. "Copy script ran" says no more than that: what the script
  printed is in the trace, whether it succeeded is not;
- how the run ended. "Unfinished" is interrupted, cut short or still going on;
- ruv and its command:
  started              the launcher ran the command, with whatever success
  started or declined  the user may have been asked whether to go on, and what
                       was answered is not in the trace
  unknown              the run is unfinished at that point, or lines are missing
  not started
"Mixed with another run" ran at the same time as another, and some of its lines
may be the other's. A command that the trace may have cut ends with "..." (in
JSON, "command_cut" is true).

The trace may hold any bytes. Control characters and invalid UTF-8 are shown as
\xHH; in JSON, U+FFFD stands for invalid UTF-8. Each FILE is read by itself; for
runs that go on in the next file: cat OLD NEW | ruv-trace -. A compressed FILE
is refused: zcat FILE | ruv-trace -

Exit status: 0; 1 when a file cannot be read or the output cannot be written;
2 for a wrong option.
)";

std::string DefaultFile() { return std::string(NZEMRUVTAV::kLogDirectory) + "/" + NZEMRUVTAV::kLogFile; }

// Whether the file begins as a rotated trace does once it is compressed. False for what cannot be read twice.
bool IsCompressed(int descriptor) {
  unsigned char magic[2] = {};
  return pread(descriptor, magic, sizeof magic, 0) == sizeof magic && magic[0] == 0x1F && magic[1] == 0x8B;
}

// Reports the runs of one file. Returns false, with a message, when it cannot be opened or read to its end, or is
// compressed.
bool ReportFile(const std::string& file, bool json, bool name_file) {
  const bool standard_input = file == "-";
  const int descriptor = standard_input ? STDIN_FILENO : open(file.c_str(), O_RDONLY | O_CLOEXEC);
  int error = descriptor < 0 ? errno : 0;
  if (descriptor >= 0 && IsCompressed(descriptor)) {
    std::fprintf(stderr, "ruv-trace: %s is compressed: use zcat %s | ruv-trace -\n", file.c_str(), file.c_str());
    if (!standard_input) close(descriptor);
    return false;
  }
  if (descriptor >= 0) {
    const std::string heading = name_file ? Printable(file) + ": " : "";
    TraceReader reader(
        [&](const Run& run) { std::fputs((json ? JsonLine(run, file) : heading + HumanLine(run)).c_str(), stdout); });
    LineSource lines(descriptor);
    std::string_view line;
    while (lines.Next(line)) reader.Take(line);
    reader.End();
    error = lines.Error();
    if (!standard_input) close(descriptor);
  }
  if (error != 0) std::fprintf(stderr, "ruv-trace: cannot read %s: %s\n", file.c_str(), std::strerror(error));
  return error == 0;
}

// Whether all output got where it should; a message otherwise.
bool Written() {
  if (std::fflush(stdout) == 0 && std::ferror(stdout) == 0) return true;
  std::perror("ruv-trace: cannot write");
  return false;
}

}  // namespace

int main(int argc, char** argv) {
  enum : int { kJson = 'j', kHelpOption = 'h', kVersion = 'V' };
  static constexpr option kOptions[] = {{"json", no_argument, nullptr, kJson},
                                        {"help", no_argument, nullptr, kHelpOption},
                                        {"version", no_argument, nullptr, kVersion},
                                        {nullptr, 0, nullptr, 0}};
  bool json = false;
  for (int letter = 0; (letter = getopt_long(argc, argv, "h", kOptions, nullptr)) != -1;) {
    switch (letter) {
      case kJson:
        json = true;
        break;
      case kHelpOption:
        std::printf(kHelp, DefaultFile().c_str());
        return Written() ? EXIT_SUCCESS : EXIT_FAILURE;
      case kVersion:
        std::puts("ruv-trace " RUV_VERSION);
        return Written() ? EXIT_SUCCESS : EXIT_FAILURE;
      default:
        std::fputs("Try ruv-trace --help.\n", stderr);
        return kUsageError;
    }
  }
  std::vector<std::string> files(argv + optind, argv + argc);
  if (files.empty()) files.push_back(DefaultFile());
  bool all_read = true;
  for (const std::string& file : files) all_read = ReportFile(file, json, files.size() > 1) && all_read;
  return Written() && all_read ? EXIT_SUCCESS : EXIT_FAILURE;
}
