// Messages for the user: standard output only. Write errors are ignored.
#pragma once

#include <cstdio>

namespace NZEMRUVTAV {

// Prints the text without a line feed or a flush: the next message continues the line.
inline void Print(const char* text) { std::fputs(text, stdout); }

inline void FlushConsole() { std::fflush(stdout); }

// Prints the text and a line feed, and flushes.
inline void PrintLine(const char* text) {
  Print(text);
  Print("\n");
  FlushConsole();
}

}  // namespace NZEMRUVTAV
