// Start-up: where the launcher lives and what machine it runs on.
#include <dlfcn.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <exception>
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
constexpr std::string_view kOperatingSystemKey = "ZEM_SYSTEM_OS=";
constexpr std::string_view kMachineTypeKey = "ZEM_SYSTEM_MT=";
constexpr std::string_view kArchitectureKey = "ZEM_SYSTEM_ARCH=";

// What OSMapping gets for a value that is no int: a code that no system has, so that the default stays.
constexpr int kNoOperatingSystemCode = -1;

// An address in this program. The library is linked statically, so the object that holds it is the one with main.
constexpr char kAddressInProgram = 0;

// Finds the key anywhere in the line; sets value to everything after its first occurrence.
bool FindValue(std::string_view line, std::string_view key, std::string& value) {
  const std::size_t position = line.find(key);
  if (position == std::string_view::npos) return false;
  value = line.substr(position + key.size());
  return true;
}

// Reads an integer at the beginning of the text: leading white space skipped, an optional sign, decimal digits.
int OperatingSystemCode(const std::string& text) {
  char* end = nullptr;
  errno = 0;
  const long code = std::strtol(text.c_str(), &end, 10);
  const bool is_int = end != text.c_str() && errno == 0 && code >= INT_MIN && code <= INT_MAX;
  return is_int ? static_cast<int>(code) : kNoOperatingSystemCode;
}

// The path of the running executable, of any length; empty when /proc does not tell.
std::string RunningExecutable() {
  std::string path(256, '\0');
  for (;;) {
    const ssize_t length = readlink("/proc/self/exe", path.data(), path.size());
    if (length < 0) return "";
    if (static_cast<std::size_t>(length) < path.size()) {
      path.resize(static_cast<std::size_t>(length));
      return path;
    }
    path.resize(path.size() * 2);
  }
}

}  // namespace

TAVMaster::TAVMaster() {
  const TraceScope trace(*this, "TAVMaster", "[Debug:] Enter: TAVMaster::TAVMaster()");
  operatingSystemType = "windows";
  machineType = "0000";
  operatingSystemArch = "64";
  workingPath = GetTAVBinaryPath();
  const char* portable_directory = std::getenv("ZEM_PORTABLE_EXEC_DIR");
  portablePath = portable_directory == nullptr ? "" : portable_directory;

  // The script's directory is bare, unlike the paths of the commands to come.
  const std::string command = workingPath + kFileSeparator + "guihelper.sh" + kSpaceSeparator + OutputToNULL;
  DebugLog("[Status:]TAVMaster: command = %s", command.c_str());
  RunInShell(command);
  ReadSystemInformation();

  TAVMasterGetSupportList();
  uncompressedPath = "/tmp/tav";
  repositoryPath = "/var/ZEM_Support";

  DebugLog("[Status:]OS = %s", operatingSystemType.c_str());
  DebugLog("[Status:]MT = %s", machineType.c_str());
  DebugLog("[Status:]ARCH = %s", operatingSystemArch.c_str());
  DebugLog("[Status:]Working Path = %s", workingPath.c_str());
  DebugLog("[Status:]Repository Path = %s", repositoryPath.c_str());
  DebugLog("[Status:]TAV Uncompressed Path = %s", uncompressedPath.c_str());
}

// Takes the identity from the file that guihelper.sh wrote, or that an earlier run left. Keys that never appear leave
// the defaults. A line yields the first key that it holds, in the order below; of several lines the last one wins.
void TAVMaster::ReadSystemInformation() {
  LineReader file(kSystemInformationFile);
  if (!file.IsOpen()) {
    PrintLine("WARNING:Unable to get system information!");
    operatingSystemType = machineType = operatingSystemArch = "unknown";
    return;
  }
  std::string_view line;
  std::string value;
  while (file.Next(line)) {
    if (FindValue(line, kOperatingSystemKey, value)) {
      OSMapping(OperatingSystemCode(value));
    } else if (FindValue(line, kMachineTypeKey, value)) {
      machineType = value;
    } else if (FindValue(line, kArchitectureKey, value)) {
      operatingSystemArch = value;
    }
  }
}

std::string TAVMaster::GetTAVBinaryPath() const {
  const TraceScope trace(*this, "GetTAVBinaryPath");
  Dl_info program = {};
  if (dladdr(&kAddressInProgram, &program) == 0 || program.dli_fname == nullptr || *program.dli_fname == '\0') {
    throw std::exception();
  }
  std::string path = program.dli_fname;
  // The loader reports the main program by the name it was started with: without a slash, that is no path at all.
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
