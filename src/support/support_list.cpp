// The machine types that the application supports: a text file with one "<MT>1234</MT>" a line, never parsed as XML.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <string_view>
#include <vector>

#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/line_reader.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {
namespace {

constexpr std::string_view kOpeningTag = "<MT>";
constexpr std::string_view kClosingTag = "</MT>";

// The entry stands here in its line, wherever the tag was found.
constexpr std::size_t kEntryPosition = 4;
constexpr std::size_t kEntryLength = 4;

// An entry as a number: its bytes, padded with NUL, and its length behind them. Numbers compare as the entries do, and
// a long list is sorted as numbers in a fraction of the time that it takes to put it into a set in the file's order.
using PackedEntry = std::uint64_t;

PackedEntry Pack(std::string_view entry) {
  PackedEntry packed = 0;
  for (std::size_t i = 0; i < kEntryLength; ++i) {
    packed = packed << 8U | (i < entry.size() ? static_cast<unsigned char>(entry[i]) : 0U);
  }
  return packed << 8U | entry.size();
}

std::string Unpack(PackedEntry packed) {
  std::string entry(packed & 0xFFU, '\0');
  for (std::size_t i = 0; i < entry.size(); ++i) {
    entry[i] = static_cast<char>(packed >> 8U * (kEntryLength - i) & 0xFFU);
  }
  return entry;
}

std::string SupportListPath(const std::string& working_path) {
  return working_path + kFileSeparator + "data" + kFileSeparator + "supportlist.xml";
}

}  // namespace

int TAVMaster::TAVMasterGetSupportList() {
  const TraceScope trace(*this, "TAVMasterGetSupportList");
  supportList.clear();
  LineReader file(SupportListPath(GetWorkingPath()));
  if (!file.IsOpen()) {
    PrintLine("WARNING:Unable to get system support information!");
    return -1;
  }
  std::vector<PackedEntry> entries;
  std::string_view line;
  while (file.Next(line)) {
    if (line.find(kOpeningTag) != std::string_view::npos) {
      entries.push_back(Pack(line.substr(kEntryPosition, kEntryLength)));
    }
  }
  std::sort(entries.begin(), entries.end());
  entries.erase(std::unique(entries.begin(), entries.end()), entries.end());
  for (const PackedEntry entry : entries) supportList.emplace_hint(supportList.end(), Unpack(entry));
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
  // Without its line feed the entry would stand behind the last line, where no reader finds it.
  if (std::fflush(file) == 0) {
    const std::string entry = std::string(kOpeningTag) + machineType + std::string(kClosingTag);
    std::fwrite(entry.data(), 1, entry.size(), file);
  }
  std::fclose(file);
  return 1;
}

bool TAVMaster::isSystemInSupportList() const { return supportList.count(machineType) != 0; }

}  // namespace NZEMRUVTAV
