// Start-up: finds the launcher's directory and discovers the machine.
#include <dlfcn.h>
#include <sys/auxv.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <exception>
#include <optional>
#include <string_view>

#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/line_reader.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {
namespace {

constexpr const char* kSystemInformationFile = "/var/log/TAV_Support/guihelp.dat";
constexpr const char* kRepositoryDirectory = "/var/ZEM_Support";
constexpr const char* kExpansionDirectory = "/tmp/tav";

constexpr std::string_view kOperatingSystemKey = "ZEM_SYSTEM_OS=";
constexpr std::string_view kMachineTypeKey = "ZEM_SYSTEM_MT=";
constexpr std::string_view kArchitectureKey = "ZEM_SYSTEM_ARCH=";

// Passed to OSMapping if the value is not an int. No system has this code, so nothing changes.
constexpr int kNoOperatingSystemCode = -1;

// dladdr needs an address inside the launcher's executable; this file is linked into it.
constexpr char kAddressInProgram = 0;

// Returns everything after the first occurrence of the key in the line.
std::optional<std::string> ValueOf(std::string_view key, std::string_view line) {
  const std::size_t position = line.find(key);
  if (position == std::string_view::npos) return std::nullopt;
  return std::string(line.substr(position + key.size()));
}

// Reads an integer at the beginning of the text: leading white space skipped, an optional sign, decimal digits.
int OperatingSystemCode(const std::string& text) {
  char* end = nullptr;
  errno = 0;
  const long code = std::strtol(text.c_str(), &end, 10);
  const bool is_int = end != text.c_str() && errno == 0 && code >= INT_MIN && code <= INT_MAX;
  return is_int ? static_cast<int>(code) : kNoOperatingSystemCode;
}

// Returns the path of the running executable as /proc gives it or, where /proc is not mounted, as execve(2) got it.
std::string RunningExecutable() {
  std::string path(256, '\0');
  for (;;) {
    const ssize_t length = readlink("/proc/self/exe", path.data(), path.size());
    if (length < 0) break;
    if (static_cast<std::size_t>(length) < path.size()) {
      path.resize(static_cast<std::size_t>(length));
      return path;
    }
    path.resize(path.size() * 2);
  }
  const auto* executed = reinterpret_cast<const char*>(getauxval(AT_EXECFN));  // NOLINT(performance-no-int-to-ptr)
  return executed == nullptr ? "" : executed;
}

}  // namespace

TAVMaster::TAVMaster() {
  const TraceScope trace(*this, __func__, "[Debug:] Enter: TAVMaster::TAVMaster()");
  operatingSystemType = "windows";
  machineType = "0000";
  operatingSystemArch = "64";
  workingPath = GetTAVBinaryPath();
  const char* portable_directory = std::getenv("ZEM_PORTABLE_EXEC_DIR");
  portablePath = portable_directory == nullptr ? "" : portable_directory;

  // The script's path is bare, unlike the paths in all later commands.
  const std::string command = workingPath + kFileSeparator + "guihelper.sh" + kSpaceSeparator + OutputToNULL;
  DebugLog("[Status:]TAVMaster: command = %s", command.c_str());
  RunInShell(command);
  ReadSystemInformation();

  TAVMasterGetSupportList();
  uncompressedPath = kExpansionDirectory;
  repositoryPath = kRepositoryDirectory;

  DebugLog("[Status:]OS = %s", operatingSystemType.c_str());
  DebugLog("[Status:]MT = %s", machineType.c_str());
  DebugLog("[Status:]ARCH = %s", operatingSystemArch.c_str());
  DebugLog("[Status:]Working Path = %s", workingPath.c_str());
  DebugLog("[Status:]Repository Path = %s", repositoryPath.c_str());
  DebugLog("[Status:]TAV Uncompressed Path = %s", uncompressedPath.c_str());
}

// Reads the identity from the file that guihelper.sh wrote, or that an earlier run left. A missing key leaves its
// default. Of several keys on one line the one tested first below counts; of several lines with a key, the last.
void TAVMaster::ReadSystemInformation() {
  LineReader file(kSystemInformationFile);
  if (!file.IsOpen()) {
    PrintLine("WARNING:Unable to get system information!");
    operatingSystemType = machineType = operatingSystemArch = "unknown";
    return;
  }
  std::string_view line;
  while (file.Next(line)) {
    if (const auto code = ValueOf(kOperatingSystemKey, line)) {
      OSMapping(OperatingSystemCode(*code));
    } else if (const auto type = ValueOf(kMachineTypeKey, line)) {
      machineType = *type;
    } else if (const auto architecture = ValueOf(kArchitectureKey, line)) {
      operatingSystemArch = *architecture;
    }
  }
}

std::string TAVMaster::GetTAVBinaryPath() const {
  const TraceScope trace(*this, __func__);
  Dl_info program = {};
  if (dladdr(&kAddressInProgram, &program) == 0 || program.dli_fname == nullptr || *program.dli_fname == '\0') {
    throw std::exception();
  }
  std::string path = program.dli_fname;
  // The loader reports the main program by the name it was started with. Without a slash that is not a path.
  if (path.find(kFileSeparator) == std::string::npos) path = RunningExecutable();
  const std::size_t last_separator = path.rfind(kFileSeparator);
  if (last_separator == std::string::npos) throw std::exception();
  return path.substr(0, last_separator);
}

bool TAVMaster::isPortableRUV() const {
  if (portablePath.empty()) {
    DebugLog("[Status:]This is not portable version of RUV");
    return false;
  }
  DebugLog("[Status:]This is a portable RUV,portablePath = %s", portablePath.c_str());
  return true;
}

}  // namespace NZEMRUVTAV
