// Formats a run for output.
#ifndef RUV_TRACE_REPORT_H
#define RUV_TRACE_REPORT_H

#include <string>
#include <string_view>

#include "run.h"

namespace ruv_trace {

inline constexpr std::string_view kOk = "ok";
inline constexpr std::string_view kProblem = "problem";

struct Verdict {
  std::string_view word;  // "ok", "problem", "unknown"
  std::string reason;     // empty if ok
};
Verdict Judge(const Run& run);

// The lines end with a line feed; none contains a control character.
std::string TableHeader();
std::string TableLine(const Run& run);
// Returns the details that --long adds, on several indented lines.
std::string Details(const Run& run, bool show_passwords);
// Returns the line of --check.
std::string CheckLine(const Run& run);
std::string JsonLine(const Run& run, bool show_passwords);

// Returns the text with control characters and invalid UTF-8 made visible.
std::string Printable(std::string_view text);

}  // namespace ruv_trace

#endif  // RUV_TRACE_REPORT_H
