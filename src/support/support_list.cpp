// The machine types that the application supports: a text file with one "<MT>1234</MT>" per line, not parsed as XML.
#include <cstdio>
#include <string_view>

#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/line_reader.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {
namespace {

constexpr std::string_view kOpeningTag = "<MT>";
constexpr std::string_view kClosingTag = "</MT>";

// The entry is read from this column, even if the tag is elsewhere on the line.
constexpr std::size_t kEntryPosition = 4;
constexpr std::size_t kEntryLength = 4;

std::string SupportListPath(const std::string& working_path) {
  return working_path + kFileSeparator + "data" + kFileSeparator + "supportlist.xml";
}

}  // namespace

int TAVMaster::TAVMasterGetSupportList() {
  const TraceScope trace(*this, __func__);
  supportList.clear();
  LineReader file(SupportListPath(GetWorkingPath()));
  if (!file.IsOpen()) {
    PrintLine("WARNING:Unable to get system support information!");
    return -1;
  }
  std::string_view line;
  while (file.Next(line)) {
    if (line.find(kOpeningTag) != std::string_view::npos) {
      supportList.emplace(line.substr(kEntryPosition, kEntryLength));
    }
  }
  return 0;
}

int TAVMaster::UpdateSupportList() {
  supportList.insert(machineType);
  std::FILE* file = std::fopen(SupportListPath(GetWorkingPath()).c_str(), "a");
  if (file == nullptr) {
    PrintLine("WARNING:Unable to Update support list, RUV setting restore default.");
    return 0;
  }
  std::fputc('\n', file);
  // Without the line feed the entry would end up on the last line, where the reader does not look.
  if (std::fflush(file) == 0) {
    const std::string entry = std::string(kOpeningTag) + machineType + std::string(kClosingTag);
    std::fwrite(entry.data(), 1, entry.size(), file);
  }
  std::fclose(file);
  return 1;
}

bool TAVMaster::isSystemInSupportList() const { return supportList.count(machineType) != 0; }

}  // namespace NZEMRUVTAV
