// The messages of a run, the order in which a launcher writes them, and the fact that each of them adds. A message out
// of sequence belongs to another run, or messages before it are missing.
#include <algorithm>
#include <charconv>
#include <initializer_list>

#include "launcher/command_fragments.h"
#include "log/trace_format.h"
#include "packages/exit_code_tables.h"
#include "run.h"

namespace ruv_trace {
namespace {

constexpr std::string_view kExitCode = "[Status:]Return Code from tavtool = ";

bool IsOneOf(std::string_view word, std::initializer_list<std::string_view> words) {
  return std::find(words.begin(), words.end(), word) != words.end();
}

// Removes the next word from a command, up to a blank outside double quotes, and returns it.
std::string_view TakeWord(std::string_view& command) {
  bool quoted = false;
  std::size_t length = 0;
  while (length < command.size() && (quoted || command[length] != ' ')) {
    if (command[length++] == '"') quoted = !quoted;
  }
  const std::string_view word = command.substr(0, length);
  command.remove_prefix(std::min(length + 1, command.size()));
  return word;
}

// True if the application's command shows that -b, -i or -r was given. An argument that contains spaces and a
// dash is in the command as typed and is taken for several arguments: the two cases look the same.
bool SuppressesQuestion(const Command& command) {
  std::string_view rest = command.text;
  while (!rest.empty()) {
    std::string_view word = TakeWord(rest);
    const bool takes_value = IsOneOf(word, {"-d", "-html"});
    if (takes_value) word = TakeWord(rest);
    if (rest.empty() && command.MayBeCut()) return false;  // the word may be longer
    if (takes_value ? IsOneOf(word, {"\"-b\"", "\"-i\"", "\"-r\""}) : IsOneOf(word, {"-b", "-i", "-r"})) return true;
  }
  return false;
}

// Returns the last argument of "SCRIPT" "EXPANSION" "APPLICATION" "SOURCE" VERSION 1>>..., or "" if it is not there.
std::string VersionIn(std::string_view copy_command) {
  const std::size_t end = copy_command.rfind(" 1>>");
  const std::size_t quote = copy_command.rfind("\" ", end);
  if (end == std::string_view::npos || quote == std::string_view::npos || quote + 2 > end) return "";
  return std::string(copy_command.substr(quote + 2, end - quote - 2));
}

void TakeSystem(Facts& facts, const Command& value) { facts.discovered.system = value.text; }
void TakeType(Facts& facts, const Command& value) { facts.discovered.machine_type = value.text; }
void TakeArchitecture(Facts& facts, const Command& value) { facts.discovered.architecture = value.text; }
void TakeCheck(Facts& facts, const Command&) { facts.mode = kCheckMode; }
void TakeDownload(Facts& facts, const Command&) { facts.mode = kUpdateMode; }
void TakeNoCopyScript(Facts& facts, const Command&) { facts.package = kNoCopyScriptFound; }
void TakeMissingValue(Facts& facts, const Command& value) { facts.option_without_value = value.text; }
void TakeCommand(Facts& facts, const Command& value) { facts.command = value; }

template <const std::string& verb>
void TakeToolCommand(Facts& facts, const Command& value) {
  facts.calls.push_back({verb, value});
  facts.calls.back().ReadIdentity(facts.used);
}

void TakePortable(Facts& facts, const Command& value) {
  facts.portable = !value.text.empty();
  if (facts.mode == kUnknown) facts.mode = kLaunchMode;
}

// After a successful download the launcher traces again whether the installation is portable.
void TakeDownloadLeft(Facts& facts, const Command&) { facts.portable = false; }

void TakeCopyScript(Facts& facts, const Command& value) {
  facts.copy_command = value;
  facts.package_version = VersionIn(value.text);
}

// An installation adds the machine type to the supported ones, so no question is asked.
void TakeCopied(Facts& facts, const Command&) {
  facts.no_question = true;
  if (facts.copy_output_lines != 1) facts.shell_complaint.clear();
  facts.package = facts.shell_complaint.empty() ? kCopyScriptRan : kCopyScriptNotRun;
}

// A launch without the test for a portable installation: packages are ignored, and no question is asked.
void TakeInvoke(Facts& facts, const Command&) {
  if (facts.mode != kUnknown) return;
  facts.no_question = true;
  facts.mode = kLaunchMode;
}

void TakeEnd(Facts& facts, const Command&) {
  if (facts.package == kUnknown) facts.package = kNotChecked;
  const bool started = facts.no_question || SuppressesQuestion(facts.command);
  facts.application = facts.mode != kLaunchMode ? kNotStarted : started ? kStarted : kStartedOrDeclined;
}

// True if a run can end with these facts. If not, the lines of whole steps are missing.
bool IsOutcome(const Facts& facts) {
  if ((facts.mode == kLaunchMode) == facts.command.text.empty()) return false;
  if (facts.package == kAvailable) return facts.mode == kCheckMode;
  return facts.package != kExpanded && (facts.package != kDownloaded || facts.portable);
}

}  // namespace

struct Run::Message {
  char id;
  std::string_view next;  // ids of those that can follow
  std::string_view text;  // or its beginning: after " ", "[" and the quotation mark comes a value
  void (*take)(Facts& facts, const Command& value) = nullptr;

  bool Is(std::string_view message) const {
    if (message.compare(0, text.size(), text) != 0) return false;
    return message.size() == text.size() || std::string_view(" [\"").find(text.back()) != std::string_view::npos;
  }
};

// After each command of the package tool come its exit code and, for some codes, the first line of their message.
const Run::Message Run::kMessages[] = {
    {'A', "B", kFirstMessage},
    {kOwnDirectory, "C", "[Debug:] Entering TAVMaster::GetTAVBinaryPath()"},
    {'C', "D", "[Debug:] Exiting TAVMaster::GetTAVBinaryPath()"},
    {kHelper, "EG", "[Status:]TAVMaster: command = "},
    {'E', "F", "[Debug:] Entering TAVMaster::OSMapping(), code = "},
    {'F', "EG", "[Debug:] Exiting TAVMaster::OSMapping()"},
    {'G', "H", "[Debug:] Entering TAVMaster::TAVMasterGetSupportList()"},
    {'H', "I", "[Debug:] Exiting TAVMaster::TAVMasterGetSupportList()"},
    {'I', "J", "[Status:]OS = ", TakeSystem},
    {'J', "K", "[Status:]MT = ", TakeType},
    {'K', "L", "[Status:]ARCH = ", TakeArchitecture},
    {'L', "M", "[Status:]Working Path = "},
    {'M', "N", "[Status:]Repository Path = "},
    {'N', "O", "[Status:]TAV Uncompressed Path = "},
    {'O', "P", "[Debug:] Exiting TAVMaster::TAVMaster()"},
    {'P', "Q", "[Debug:] Entering TAVMaster::TAVMasterMain()"},
    {kOptions, "RS", "[Debug:] Entering TAVMaster::ParseParameters()"},
    {kUnknownOption, "RS", "[Status:]Warning: Unknown Parameter \""},
    {kOptionsLeft, "Tabv", "[Debug:] Exiting TAVMaster::ParseParameters()"},
    {'T', "U", "[Debug:] Entering TAVMaster::CheckUpdate()", TakeCheck},
    {'U', "V", "[Status:]CheckUpdate:TAVToolCmd = ", TakeToolCommand<NZEMRUVTAV::TAVTOOL_CMD_COMPWEB>},
    {'V', "W3", "[Debug:] Exiting TAVMaster::CheckUpdate()"},
    {'W', "ab", "[Debug:] Entering TAVMaster::AcquireUpdate()", TakeDownload},
    {'X', "XY", "[Status:]AcquireUpdate: command = "},
    {'Y', "Z", "[Status:]AcquireUpdate: TAVToolCmd = ", TakeToolCommand<NZEMRUVTAV::TAVTOOL_CMD_ACQUIRE>},
    {'Z', "ab3", "[Debug:] Exiting TAVMaster::AcquireUpdate()", TakeDownloadLeft},
    {'a', "XYhv", "[Status:]This is not portable version of RUV", TakePortable},
    {'b', "XYc3", "[Status:]This is a portable RUV,portablePath = ", TakePortable},
    {'c', "def", "[Debug:] Entering TAVMaster::CopyPortableTAVToRepository()"},
    {'d', "g", "[Status:]CopyPortableTAVToRepository: The directory <Portable>/update does not Exist!"},
    {'e', "def", "[Status:]CopyPortableTAVToRepository: command = "},
    {'f', "g", "[Status:]CopyPortableTAVToRepository: TAVToolCmd = ", TakeToolCommand<NZEMRUVTAV::TAVTOOL_CMD_COPY>},
    {'g', "hv", "[Debug:] Exiting TAVMaster::CopyPortableTAVToRepository()"},
    {'h', "i", "[Debug:] Entering TAVMaster::CompareTAVPackage()"},
    {'i', "j", "[Status:]CompareTAVPackage: TAVToolCmd = ", TakeToolCommand<NZEMRUVTAV::TAVTOOL_CMD_COMPLOC>},
    {'j', "kv3", "[Debug:] Exiting TAVMaster::CompareTAVPackage()"},
    {'k', "l", "[Debug:] Entering TAVMaster::DecompressTAV()"},
    {'l', "mu", "[Status:]DecompressTAV: TAVToolCmd = ", TakeToolCommand<NZEMRUVTAV::TAVTOOL_CMD_EXPAND>},
    {'m', "no", "[Debug:] Entering TAVMaster::CopyTAVToRUVFoler()"},
    {'n', "p", "[Status:]CopyTAVToRUVFoler: script file \"", TakeNoCopyScript},
    {kCopyScript, "q", "[Status:]CopyTAVToRUVFoler: command = ", TakeCopyScript},
    {'p', "r", "[Debug:] Exiting TAVMaster::CopyTAVToRUVFoler()"},
    {'q', "s", "[Debug:] Exiting TAVMaster::CopyTAVToRUVFoler()", TakeCopied},
    {'r', "u", "[Status:]DecompressTAV: Failed to copy TAV to RUV Folder!"},
    {'s', "u", "[Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!"},
    {'u', "v3", "[Debug:] Exiting TAVMaster::DecompressTAV()"},
    {'v', "wxy", "[Debug:] Entering TAVMaster::InvokeRUV()", TakeInvoke},
    {'w', "wxy", "[Debug:] Processing special parameters ["},
    {'x', "wxy", "[Error:]InvokeRUV: required parameters are missing for option = ", TakeMissingValue},
    {kApplication, "2", "[Status:]InvokeRUV: command = ", TakeCommand},
    {'2', "3", "[Debug:] Exiting TAVMaster::InvokeRUV()"},
    {'3', "4", "[Debug:] Exiting TAVMaster::TAVMasterMain()"},
    {'4', "5", "[Debug:] Entering TAVMaster::~TAVMaster()"},
    {kEnd, "", kLastMessage, TakeEnd},
};

bool Run::Take(std::string_view message) {
  if (std::find(doubtful_after_.begin(), doubtful_after_.end(), last_) != doubtful_after_.end()) frozen_ = true;
  if (!error_text_due_.empty()) {
    const bool is_due = message == error_text_due_;
    if (is_due) error_text_due_ = {};
    return is_due;
  }
  if (awaits_exit_code_) return TakeExitCode(message);
  const Message* next = Next(message);
  if (next == nullptr) return false;
  last_ = next;
  awaits_exit_code_ = next->text.find("TAVToolCmd") != std::string_view::npos;
  if (frozen_ || next->take == nullptr) return true;
  constexpr std::size_t kLongest = NZEMRUVTAV::kMessageBufferSize - 1;
  next->take(facts_, {std::string(message.substr(next->text.size())), kLongest - std::min(message.size(), kLongest)});
  return !Finished() || IsOutcome(facts_);
}

const Run::Message* Run::Next(std::string_view message) const {
  if (last_ == nullptr) return kMessages[0].Is(message) ? kMessages : nullptr;
  const Message* const next = std::find_if(std::begin(kMessages), std::end(kMessages), [&](const Message& each) {
    return last_->next.find(each.id) != std::string_view::npos && each.Is(message);
  });
  return next == std::end(kMessages) ? nullptr : next;
}

bool Run::TakeExitCode(std::string_view message) {
  if (message.substr(0, kExitCode.size()) != kExitCode) return false;
  int exit_code = 0;
  const char* const end = message.data() + message.size();
  const auto [rest, error] = std::from_chars(message.data() + kExitCode.size(), end, exit_code);
  if (error != std::errc() || rest != end) return false;
  awaits_exit_code_ = false;
  error_text_due_ = ErrorText(exit_code);
  if (frozen_) return true;
  ToolCall& call = facts_.calls.back();
  call.exit_code = exit_code;
  if (!call.Package().empty()) facts_.package = call.Package();
  return true;
}

bool Run::Knows(std::string_view message) {
  return message.substr(0, kExitCode.size()) == kExitCode ||
         std::any_of(std::begin(kMessages), std::end(kMessages), [&](const Message& each) { return each.Is(message); });
}

bool Run::Closes(std::string_view message) {
  return std::any_of(std::end(kMessages) - 4, std::end(kMessages),
                     [&](const Message& each) { return each.Is(message); });
}

char Run::Last() const { return last_ == nullptr ? '\0' : last_->id; }

}  // namespace ruv_trace
