// The trace file. It is opened and closed for every line, so that the line is in the file when DebugLog returns and the
// file is not open while other programs run.
#include <cstdarg>
#include <cstdio>
#include <new>

#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_format.h"

namespace NZEMRUVTAV {
namespace {

// Appends the line; returns false if the file cannot be opened. The longest line fits into the buffer, so fclose writes
// it at once. A buffer of stdio's own would cost an allocation and another system call for every line.
bool AppendLine(const std::string& path, const std::string& line) {
  char buffer[2 * kMessageBufferSize];
  std::FILE* file = std::fopen(path.c_str(), "a+");
  if (file == nullptr) return false;
  std::setvbuf(file, buffer, _IOFBF, sizeof buffer);
  std::fputs(line.c_str(), file);
  std::fclose(file);
  return true;
}

}  // namespace

std::string TAVMaster::GetLogfileName() const {
  if (!DirExists(kLogDirectory)) RunInShell(MKDIR + kSpaceSeparator + kLogDirectory);
  return kLogDirectory + kFileSeparator + kLogFile;
}

void TAVMaster::DebugLog(const char* format, ...) const noexcept {
  char message[kMessageBufferSize] = "";
  std::va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message, sizeof message, format, arguments);
  va_end(arguments);

  bool saved = false;
  try {
    saved = AppendLine(GetLogfileName(), std::string(kLinePrefix) + message + "\n");
  } catch (const std::bad_alloc&) {  // not saved
  }
  if (!saved) PrintLine("Failed to save log into logfile");
}

}  // namespace NZEMRUVTAV
