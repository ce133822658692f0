#ifndef RUV_TRACE_REPORT_H
#define RUV_TRACE_REPORT_H

#include <string>
#include <string_view>

#include "run.h"

namespace ruv_trace {

// Both return one line with its line feed, whatever bytes the trace holds.

// For people. Control characters and what is no UTF-8 read \xHH, so that a trace cannot steer a terminal.
std::string HumanLine(const Run& run);

// For programs: one JSON object. What is no UTF-8 becomes U+FFFD, the replacement character.
std::string JsonLine(const Run& run, std::string_view file);

// The text as HumanLine shows it.
std::string Printable(std::string_view text);

}  // namespace ruv_trace

#endif  // RUV_TRACE_REPORT_H
