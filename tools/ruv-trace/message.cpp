#include "message.h"

#include <charconv>
#include <iterator>

namespace ruv_trace {
namespace {

struct MemberFacts {
  Member member;
  Member caller;
  std::string_view name;
  std::string_view ended_in;
};

// In the order of the enumeration. The launcher ends by itself, without a further line, in four places: when its
// directory is not found, after the help text, after rejected options, and when the user interrupts the package tool.
constexpr MemberFacts kMembers[] = {
    {kOutside, kOutside, "", "unfinished between two steps"},
    {kSession, kOutside, "TAVMaster", "unfinished while looking at the machine"},
    {kOwnDirectory, kSession, "GetTAVBinaryPath", "own directory not found, or cut short"},
    {kSystemCode, kSession, "OSMapping", "unfinished while looking at the machine"},
    {kSupportList, kSession, "TAVMasterGetSupportList", "unfinished while reading the support list"},
    {kDriver, kOutside, "TAVMasterMain", "unfinished between two steps"},
    {kOptions, kDriver, "ParseParameters", "help shown, or cut short"},
    {kImport, kDriver, "CopyPortableTAVToRepository", "unfinished in the import from portable media"},
    {kCheck, kDriver, "CheckUpdate", "unfinished in the online check"},
    {kDownload, kDriver, "AcquireUpdate", "unfinished in the download"},
    {kComparison, kDriver, "CompareTAVPackage", "unfinished in the comparison"},
    {kExpansion, kDriver, "DecompressTAV", "unfinished in the expansion"},
    {kCopying, kExpansion, "CopyTAVToRUVFoler", "unfinished in the copy script"},
    {kLaunch, kDriver, "InvokeRUV", "unfinished in ruv or the question before it"},
    {kSessionEnd, kOutside, "~TAVMaster", "unfinished between two steps"},
};

constexpr bool InOrder() {
  std::size_t i = 0;
  for (const MemberFacts& facts : kMembers) {
    if (facts.member != i++) return false;
  }
  return true;
}
static_assert(InOrder());

struct StatusLine {
  std::string_view beginning;
  Kind kind;
  Member member;
  std::optional<std::string> Identity::*field = nullptr;
};

// The lines that open with "[Status:]".
constexpr StatusLine kStatusLines[] = {
    {"OS = ", Kind::kIdentity, kSession, &Identity::system},
    {"MT = ", Kind::kIdentity, kSession, &Identity::machine_type},
    {"ARCH = ", Kind::kIdentity, kSession, &Identity::architecture},
    {"Return Code from tavtool = ", Kind::kToolExit, kOutside},
    {"This is not portable version of RUV", Kind::kPortableTest, kDriver},
    {"This is a portable RUV,", Kind::kPortableTest, kDriver},
    {"CopyPortableTAVToRepository: TAVToolCmd = ", Kind::kToolCommand, kImport},
    {"CheckUpdate:TAVToolCmd = ", Kind::kToolCommand, kCheck},
    {"AcquireUpdate: TAVToolCmd = ", Kind::kToolCommand, kDownload},
    {"CompareTAVPackage: TAVToolCmd = ", Kind::kToolCommand, kComparison},
    {"DecompressTAV: TAVToolCmd = ", Kind::kToolCommand, kExpansion},
    {"CopyTAVToRUVFoler: command = ", Kind::kCopyCommand, kCopying},
    {"CopyTAVToRUVFoler: script file ", Kind::kNoCopyScript, kCopying},
    {"DecompressTAV: Copy TAV to RUV Folder Successfully!", Kind::kCopied, kExpansion},
    {"InvokeRUV: command = ", Kind::kApplicationCommand, kLaunch},
};

// Takes the beginning off the text when it is there.
bool Skip(std::string_view& text, std::string_view beginning) {
  if (text.compare(0, beginning.size(), beginning) != 0) return false;
  text.remove_prefix(beginning.size());
  return true;
}

std::optional<Message> MemberMessage(Kind kind, std::string_view text) {
  const std::size_t parenthesis = text.find('(');
  if (parenthesis == 0 || parenthesis == std::string_view::npos) return {};
  const std::string_view name = text.substr(0, parenthesis);
  const std::string_view rest = text.substr(parenthesis);
  for (const MemberFacts& facts : kMembers) {
    if (facts.name != name) continue;
    const bool whole = rest == "()" || (facts.member == kSystemCode && rest.compare(0, 10, "(), code =") == 0);
    return whole ? std::optional<Message>({kind, facts.member}) : std::nullopt;
  }
  return {};
}

std::optional<Message> StatusMessage(std::string_view text) {
  for (const StatusLine& line : kStatusLines) {
    std::string_view value = text;
    if (!Skip(value, line.beginning)) continue;
    Message message = {line.kind, line.member, value, line.field};
    if (line.kind != Kind::kToolExit) return message;
    // A number with something behind it is a line that another one was written into.
    const char* const end = value.data() + value.size();
    const auto [behind, error] = std::from_chars(value.data(), end, message.exit_code);
    return error == std::errc() && behind == end ? std::optional(message) : std::nullopt;
  }
  return {};
}

}  // namespace

Member CallerOf(Member member) { return kMembers[member].caller; }

std::string_view EndedIn(Member member) { return kMembers[member].ended_in; }

std::optional<Message> ParseMessage(std::string_view line) {
  if (Skip(line, "[Status:]")) return StatusMessage(line);
  if (!Skip(line, "[Debug:] E")) return {};
  if (Skip(line, "ntering TAVMaster::")) return MemberMessage(Kind::kEntry, line);
  if (Skip(line, "xiting TAVMaster::")) return MemberMessage(Kind::kExit, line);
  if (line == "nter: TAVMaster::TAVMaster()") return Message{Kind::kBegin, kSession};
  return {};
}

}  // namespace ruv_trace
