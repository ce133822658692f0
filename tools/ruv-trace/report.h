// Formats a run for output. The lines end with a line feed; none contains a control character.
#pragma once

#include <string>

#include "run.h"

namespace ruv_trace {

std::string TableHeader();
// At most 80 characters.
std::string TableLine(const Run& run);
// What --long adds: several indented lines.
std::string Details(const Run& run, bool show_passwords);
std::string CheckLine(const Run& run);
std::string JsonLine(const Run& run, bool show_passwords);

// Returns the text with everything but printable ASCII escaped.
std::string Printable(const std::string& text);

}  // namespace ruv_trace
