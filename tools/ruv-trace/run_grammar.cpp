// The messages of a run in the order in which one launcher writes them. A message that is not next is another run's, or
// some are missing before it.
#include <algorithm>
#include <array>

#include "launcher/command_fragments.h"
#include "log/trace_format.h"
#include "packages/exit_code_tables.h"
#include "run.h"

namespace ruv_trace {

// Named after the last message. The launcher waits for a program in the states with "Running" in their name.
enum Run::State : unsigned char {
  kOutside,
  kConstructor,
  kOwnDirectory,
  kOwnDirectoryLeft,
  kRunningHelper,
  kSystemCode,
  kSupportList,
  kSupportListLeft,
  kSystem,
  kMachineType,
  kArchitecture,
  kWorkingPath,
  kRepositoryPath,
  kExpansionPath,
  kConstructorLeft,
  kDriver,
  kOptions,
  kOptionsLeft,
  kCheck,
  kRunningCheck,
  kCheckDone,
  kCheckLeft,
  kDownload,
  kDownloadPath,
  kRunningDownload,
  kDownloadDone,
  kDownloadLeft,
  kUpdateInstalled,
  kUpdatePortable,
  kLaunchPortable,
  kImport,
  kRunningImport,
  kImportDone,
  kRepository,
  kComparison,
  kRunningComparison,
  kComparisonDone,
  kComparisonLeft,
  kExpansion,
  kRunningExpansion,
  kExpansionDone,
  kCopy,
  kNoCopyScript,
  kRunningCopyScript,
  kCopyFailed,
  kCopyDone,
  kInstalled,
  kExpansionLeft,
  kApplication,
  kRunningApplication,
  kApplicationLeft,
  kDriverLeft,
  kDestructor,
  kEnd,
};

namespace {

// When a message can follow: after which results of the last tool call, and in which mode.
enum When : unsigned {
  kSuccess = 1U << NZEMRUVTAV::kSuccess,
  kFailure = 1U << NZEMRUVTAV::kFailure,
  kPackage = 1U << NZEMRUVTAV::kPackageToInstall,
  kNoPayload = 1U << NZEMRUVTAV::kNoPayload,
  kAnyResult = kSuccess | kFailure | kPackage | kNoPayload,
  kLaunching = 1U << 8U,
  kUpdating = 1U << 9U,
  kAnyMode = kLaunching | kUpdating,
  kAlways = kAnyResult | kAnyMode,
};

constexpr std::string_view kNotPortable = "[Status:]This is not portable version of RUV";
constexpr std::string_view kPortable = "[Status:]This is a portable RUV,portablePath = ";
constexpr std::string_view kExitCode = "[Status:]Return Code from tavtool = ";
constexpr std::string_view kCompare = "[Debug:] Entering TAVMaster::CompareTAVPackage()";
constexpr std::string_view kInvoke = "[Debug:] Entering TAVMaster::InvokeRUV()";
constexpr std::string_view kLeaveDriver = "[Debug:] Exiting TAVMaster::TAVMasterMain()";

// A message that ends like this goes on with a value.
bool HasValue(std::string_view beginning) {
  return std::string_view(" [\"").find(beginning.back()) != std::string::npos;
}

}  // namespace

struct Run::Transition {  // NOLINT(clang-analyzer-optin.performance.Padding): the order in which a row is read
  State from;
  std::string_view message;  // or its beginning
  State to;
  bool (Run::*take)(std::string_view value) = nullptr;
  unsigned when = kAlways;
};

// In the order of the states.
const Run::Transition Run::kTransitions[] = {
    {kOutside, kFirstMessage, kConstructor},
    {kConstructor, kSecondMessage, kOwnDirectory},
    {kOwnDirectory, "[Debug:] Exiting TAVMaster::GetTAVBinaryPath()", kOwnDirectoryLeft},
    {kOwnDirectoryLeft, "[Status:]TAVMaster: command = ", kRunningHelper},
    {kRunningHelper, "[Debug:] Entering TAVMaster::OSMapping(), code = ", kSystemCode},
    {kRunningHelper, "[Debug:] Entering TAVMaster::TAVMasterGetSupportList()", kSupportList},
    {kSystemCode, "[Debug:] Exiting TAVMaster::OSMapping()", kRunningHelper},
    {kSupportList, "[Debug:] Exiting TAVMaster::TAVMasterGetSupportList()", kSupportListLeft},
    {kSupportListLeft, "[Status:]OS = ", kSystem, &Run::TakeSystem},
    {kSystem, "[Status:]MT = ", kMachineType, &Run::TakeMachineType},
    {kMachineType, "[Status:]ARCH = ", kArchitecture, &Run::TakeArchitecture},
    {kArchitecture, "[Status:]Working Path = ", kWorkingPath},
    {kWorkingPath, "[Status:]Repository Path = ", kRepositoryPath},
    {kRepositoryPath, "[Status:]TAV Uncompressed Path = ", kExpansionPath},
    {kExpansionPath, "[Debug:] Exiting TAVMaster::TAVMaster()", kConstructorLeft},
    {kConstructorLeft, "[Debug:] Entering TAVMaster::TAVMasterMain()", kDriver},
    {kDriver, "[Debug:] Entering TAVMaster::ParseParameters()", kOptions},
    {kOptions, "[Status:]Warning: Unknown Parameter \"", kOptions},
    {kOptions, "[Debug:] Exiting TAVMaster::ParseParameters()", kOptionsLeft},
    {kOptionsLeft, "[Debug:] Entering TAVMaster::CheckUpdate()", kCheck, &Run::TakeCheck},
    {kOptionsLeft, kNotPortable, kRepository, &Run::TakeLaunch},
    {kOptionsLeft, kPortable, kLaunchPortable, &Run::TakeLaunch},
    {kOptionsLeft, kInvoke, kApplication, &Run::TakeRemoteLaunch},
    {kCheck, "[Status:]CheckUpdate:TAVToolCmd = ", kRunningCheck, &Run::TakeCommandOf<NZEMRUVTAV::TAVTOOL_CMD_COMPWEB>},
    {kRunningCheck, kExitCode, kCheckDone, &Run::TakeExitCode},
    {kCheckDone, "[Debug:] Exiting TAVMaster::CheckUpdate()", kCheckLeft},
    {kCheckLeft, "[Debug:] Entering TAVMaster::AcquireUpdate()", kDownload, &Run::TakeDownload, kSuccess | kAnyMode},
    {kCheckLeft, kLeaveDriver, kDriverLeft},
    {kDownload, kNotPortable, kDownloadPath},
    {kDownload, kPortable, kDownloadPath},
    {kDownloadPath, "[Status:]AcquireUpdate: command = ", kDownloadPath},
    {kDownloadPath, "[Status:]AcquireUpdate: TAVToolCmd = ", kRunningDownload,
     &Run::TakeCommandOf<NZEMRUVTAV::TAVTOOL_CMD_ACQUIRE>},
    {kRunningDownload, kExitCode, kDownloadDone, &Run::TakeExitCode},
    {kDownloadDone, "[Debug:] Exiting TAVMaster::AcquireUpdate()", kDownloadLeft},
    {kDownloadLeft, kNotPortable, kUpdateInstalled, nullptr, kSuccess | kAnyMode},
    {kDownloadLeft, kPortable, kUpdatePortable, nullptr, kSuccess | kAnyMode},
    {kDownloadLeft, kLeaveDriver, kDriverLeft, nullptr, (kAnyResult & ~kSuccess) | kAnyMode},
    {kUpdateInstalled, kCompare, kComparison},
    {kUpdatePortable, kLeaveDriver, kDriverLeft},
    {kLaunchPortable, "[Debug:] Entering TAVMaster::CopyPortableTAVToRepository()", kImport},
    {kImport, "[Status:]CopyPortableTAVToRepository: The directory <Portable>/update does not Exist!", kImportDone},
    {kImport, "[Status:]CopyPortableTAVToRepository: command = ", kImport},
    {kImport, "[Status:]CopyPortableTAVToRepository: TAVToolCmd = ", kRunningImport,
     &Run::TakeCommandOf<NZEMRUVTAV::TAVTOOL_CMD_COPY>},
    {kRunningImport, kExitCode, kImportDone, &Run::TakeExitCode},
    {kImportDone, "[Debug:] Exiting TAVMaster::CopyPortableTAVToRepository()", kRepository},
    {kRepository, kCompare, kComparison},
    {kRepository, kInvoke, kApplication},
    {kComparison, "[Status:]CompareTAVPackage: TAVToolCmd = ", kRunningComparison,
     &Run::TakeCommandOf<NZEMRUVTAV::TAVTOOL_CMD_COMPLOC>},
    {kRunningComparison, kExitCode, kComparisonDone, &Run::TakeExitCode},
    {kComparisonDone, "[Debug:] Exiting TAVMaster::CompareTAVPackage()", kComparisonLeft},
    {kComparisonLeft, "[Debug:] Entering TAVMaster::DecompressTAV()", kExpansion, nullptr, kPackage | kAnyMode},
    {kComparisonLeft, kInvoke, kApplication, nullptr, (kAnyResult & ~kPackage) | kLaunching},
    {kComparisonLeft, kLeaveDriver, kDriverLeft, nullptr, (kAnyResult & ~kPackage) | kUpdating},
    {kExpansion, "[Status:]DecompressTAV: TAVToolCmd = ", kRunningExpansion,
     &Run::TakeCommandOf<NZEMRUVTAV::TAVTOOL_CMD_EXPAND>},
    {kRunningExpansion, kExitCode, kExpansionDone, &Run::TakeExitCode},
    {kExpansionDone, "[Debug:] Entering TAVMaster::CopyTAVToRUVFoler()", kCopy, nullptr,
     kSuccess | kNoPayload | kAnyMode},
    {kExpansionDone, "[Debug:] Exiting TAVMaster::DecompressTAV()", kExpansionLeft, nullptr,
     kFailure | kPackage | kAnyMode},
    {kCopy, "[Status:]CopyTAVToRUVFoler: script file \"", kNoCopyScript, &Run::TakeNoCopyScript},
    {kCopy, "[Status:]CopyTAVToRUVFoler: command = ", kRunningCopyScript, &Run::TakeCopyCommand},
    {kNoCopyScript, "[Debug:] Exiting TAVMaster::CopyTAVToRUVFoler()", kCopyFailed},
    {kRunningCopyScript, "[Debug:] Exiting TAVMaster::CopyTAVToRUVFoler()", kCopyDone, &Run::TakeCopyEnd},
    {kCopyFailed, "[Status:]DecompressTAV: Failed to copy TAV to RUV Folder!", kInstalled},
    {kCopyDone, "[Status:]DecompressTAV: Copy TAV to RUV Folder Successfully!", kInstalled},
    {kInstalled, "[Debug:] Exiting TAVMaster::DecompressTAV()", kExpansionLeft},
    {kExpansionLeft, kInvoke, kApplication, nullptr, kAnyResult | kLaunching},
    {kExpansionLeft, kLeaveDriver, kDriverLeft, nullptr, kAnyResult | kUpdating},
    {kApplication, "[Debug:] Processing special parameters [", kApplication},
    {kApplication, "[Error:]InvokeRUV: required parameters are missing for option = ", kApplication,
     &Run::TakeMissingValue},
    {kApplication, "[Status:]InvokeRUV: command = ", kRunningApplication, &Run::TakeCommand},
    {kRunningApplication, "[Debug:] Exiting TAVMaster::InvokeRUV()", kApplicationLeft},
    {kApplicationLeft, kLeaveDriver, kDriverLeft},
    {kDriverLeft, "[Debug:] Entering TAVMaster::~TAVMaster()", kDestructor},
    {kDestructor, kLastMessage, kEnd, &Run::TakeEnd},
};

bool Run::IsNext(const Transition& transition, std::string_view message) const {
  const std::string_view expected = transition.message;
  if (message.compare(0, expected.size(), expected) != 0) return false;
  if (message.size() > expected.size() && !HasValue(expected)) return false;
  const unsigned mode = facts_.mode == kLaunchMode ? kLaunching : kUpdating;
  return (transition.when & mode) != 0 && (transition.when & 1U << static_cast<unsigned>(result_)) != 0;
}

bool Run::Take(std::string_view message) {
  if (state_ == doubtful_after_ && !certain_) certain_ = facts_;
  room_ = NZEMRUVTAV::kMessageBufferSize - 1 - std::min(message.size(), NZEMRUVTAV::kMessageBufferSize - 1);
  if (!message_due_.empty()) {
    const bool is_due = message == message_due_;
    message_due_ = {};
    return is_due;
  }
  // The transitions of a state are few and stand together.
  static const auto kFirst = [] {
    std::array<const Transition*, kEnd + 1> first = {};
    for (const Transition& each : kTransitions) {
      if (first[each.from] == nullptr) first[each.from] = &each;
    }
    return first;
  }();
  for (const Transition* next = kFirst[state_]; next != nullptr && next != std::end(kTransitions); ++next) {
    if (next->from != state_) break;
    if (!IsNext(*next, message)) continue;
    state_ = next->to;
    return next->take == nullptr || (this->*next->take)(message.substr(next->message.size()));
  }
  return false;
}

bool Run::Finished() const { return state_ == kEnd; }

bool Run::RunsCopyScript() const { return state_ == kRunningCopyScript; }

bool Run::RunsApplication() const { return state_ == kRunningApplication && !IsMixed(); }

bool Run::MayHaveEnded() const { return state_ == kOwnDirectory || state_ == kOptions || state_ == kOptionsLeft; }

bool Run::Knows(std::string_view message) {
  return std::any_of(std::begin(kTransitions), std::end(kTransitions), [&](const Transition& each) {
    return message.compare(0, each.message.size(), each.message) == 0;
  });
}

bool Run::Closes(std::string_view message) {
  return message == "[Debug:] Exiting TAVMaster::InvokeRUV()" || message == kLeaveDriver ||
         message == "[Debug:] Entering TAVMaster::~TAVMaster()" || message == kLastMessage;
}

std::string_view Run::Unfinished() const {
  switch (state_) {
    case kOwnDirectory:
      return "the launcher's directory was not found, or unfinished";
    case kRunningHelper:
      return "unfinished: in guihelper.sh";
    case kOptions:
      return "help shown, or unfinished";
    case kOptionsLeft:
      return "options rejected, or unfinished";
    case kRunningCheck:
    case kRunningDownload:
    case kRunningImport:
    case kRunningComparison:
    case kRunningExpansion:
      return "unfinished: in tavtool";
    case kRunningCopyScript:
      return "unfinished: in the copy script";
    case kRunningApplication:
      return "unfinished: in ruv or at the question before it";
    default:
      return "unfinished: between two steps";
  }
}

}  // namespace ruv_trace
