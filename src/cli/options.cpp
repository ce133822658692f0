// Takes the launcher's own options out of the command line that it shares with the application.
#include <algorithm>
#include <cctype>
#include <cstdlib>

#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {

struct TAVMaster::LongOption {
  const char* name;               // in lower case; the argument is folded before it is compared
  bool TAVMaster::*flag;          // set to true; null only for "--show_stderr", which is not stored in the session
  std::string TAVMaster::*value;  // set to the next argument, as typed; null for an option without a value
  bool forwarded;                 // also passed on, in lower case
};

const TAVMaster::LongOption* TAVMaster::FindLongOption(const std::string& folded_name) {
  static constexpr LongOption kLongOptions[] = {
      {"--chkupd", &TAVMaster::checkUpdate, nullptr, false},
      {"--update", &TAVMaster::doUpdate, nullptr, false},
      {"--gui", &TAVMaster::prebootGUI, nullptr, false},
      {"--cmd", &TAVMaster::prebootCmd, nullptr, false},
      {"--ipmi-lan", &TAVMaster::ignoreTAVPackage, nullptr, true},
      {"--vmware-esxi", &TAVMaster::ignoreTAVPackage, nullptr, true},
      {"--update_m", &TAVMaster::updateTargetGiven, &TAVMaster::machineType, false},
      {"--update_os", &TAVMaster::updateTargetGiven, &TAVMaster::operatingSystemType, false},
      {"--update_arch", &TAVMaster::updateTargetGiven, &TAVMaster::operatingSystemArch, false},
      {"--show_stderr", nullptr, nullptr, false},
  };
  const auto* const option = std::find_if(std::begin(kLongOptions), std::end(kLongOptions),
                                          [&](const LongOption& known) { return folded_name == known.name; });
  return option == std::end(kLongOptions) ? nullptr : option;
}

namespace {

constexpr std::size_t kMachineTypeLength = 4;
constexpr const char* kDiscardStandardError = "2>/dev/null";

bool IsHelpRequest(const std::string& argument) { return argument == "-?" || argument == "-h"; }

bool IsLongOption(const std::string& argument) { return argument.compare(0, 2, "--") == 0; }

std::string FoldedToLowerCase(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(),
                 [](unsigned char byte) { return static_cast<char>(std::tolower(byte)); });
  return text;
}

// Input files are named after the machine they were collected on: the file's name starts with the machine type.
std::string MachineTypeOfInputFile(const std::string& path) {
  const std::size_t last_separator = path.rfind(kFileSeparator);
  const std::size_t name = last_separator == std::string::npos ? 0 : last_separator + 1;
  return path.substr(name, kMachineTypeLength);
}

}  // namespace

void TAVMaster::ParseParameters(int argc, char** argv) {
  const char* rejection = nullptr;
  {
    // A block of its own, because exit() does not destroy local objects and the exit line must be traced first.
    const TraceScope trace(*this, __func__);
    TakeArguments(argc, argv);
    rejection = RejectedCombination();
    if (rejection != nullptr) PrintLine(rejection);
  }
  if (rejection != nullptr) std::exit(EXIT_FAILURE);
}

void TAVMaster::TakeArguments(int argc, char** argv) {
  bool show_stderr = false;
  for (int i = 1; i < argc; ++i) {
    const std::string argument = argv[i];
    const char* next = i + 1 < argc ? argv[i + 1] : nullptr;
    if (IsHelpRequest(argument)) {
      PrintUsage();
      std::exit(EXIT_SUCCESS);
    }
    if (!IsLongOption(argument)) {
      TakeOrdinaryArgument(argument, next);
    } else if (TakeLongOption(argument, next, show_stderr)) {
      ++i;
    }
  }
  if (!show_stderr) passThroughParams.emplace_back(kDiscardStandardError);
}

const char* TAVMaster::RejectedCombination() const {
  if (checkUpdate && doUpdate) return "ERROR: You can not specify --chkupd and --update together";
  if (updateTargetGiven && !checkUpdate && !doUpdate) {
    return "Error: You should specify [--update_m]/[--update_os]/[--update_arch] with [--chkupd] or [--update]";
  }
  return nullptr;
}

bool TAVMaster::TakeLongOption(const std::string& argument, const char* next, bool& show_stderr) {
  const std::string folded = FoldedToLowerCase(argument);
  const LongOption* option = FindLongOption(folded);
  if (option == nullptr) {
    DebugLog(
        "[Status:]Warning: Unknown Parameter \"%s\" to RUV TAV, and it will be transfered to tavtool or RUV "
        "application.",
        folded.c_str());
    passThroughParams.push_back(argument);
    return false;
  }
  if (option->flag != nullptr) {
    this->*option->flag = true;
  } else {
    show_stderr = true;
  }
  if (option->forwarded) passThroughParams.push_back(folded);
  if (option->value == nullptr || next == nullptr) return false;
  this->*option->value = next;
  return true;
}

void TAVMaster::TakeOrdinaryArgument(std::string argument, const char* next) {
  if (argument == "-i" || argument == "-r") inputFileGiven = true;
  if (argument == "-i" && next != nullptr) machineType = MachineTypeOfInputFile(next);
  if (argument == "-b") batchMode = true;
  // A value, such as a file name or an address, is quoted for the shell. An argument with a dash is left as typed.
  if (argument.find('-') == std::string::npos) FormatPathString(argument);
  passThroughParams.push_back(argument);
}

}  // namespace NZEMRUVTAV
