// TAVMaster's destructor, accessors, flag tests and shared helpers. Its constructor is in discovery.cpp.
#include <sys/stat.h>

#include "launcher/command_fragments.h"
#include "launcher/shell.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {

TAVMaster::~TAVMaster() { const TraceScope trace(*this, __func__); }

std::string TAVMaster::GetOperatingSystemType() const { return operatingSystemType; }
std::string TAVMaster::GetMachineType() const { return machineType; }
std::string TAVMaster::GetOperatingSystemArch() const { return operatingSystemArch; }
std::string TAVMaster::GetWorkingPath() const { return workingPath; }
std::string TAVMaster::GetUncompressedPath() const { return uncompressedPath; }
std::string TAVMaster::GetRepositoryPath() const { return repositoryPath; }
std::string TAVMaster::GetPortablePath() const { return portablePath; }

bool TAVMaster::isPrebootGUI() const { return prebootGUI; }
bool TAVMaster::isPrebootCmd() const { return prebootCmd; }
bool TAVMaster::isIgnoreTAVPackage() const { return ignoreTAVPackage; }
bool TAVMaster::IsWinPE3_X() const { return false; }

bool TAVMaster::FileExist(std::string path) const {
  struct stat status = {};
  return stat(path.c_str(), &status) == 0 && !S_ISDIR(status.st_mode);
}

bool TAVMaster::DirExists(std::string path) const {
  struct stat status = {};
  return stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

void TAVMaster::FormatPathString(std::string& path) const {
  path.insert(path.begin(), '"');
  path.push_back('"');
}

void TAVMaster::FormatCommandString(std::string& /*command*/) const {}

std::string TAVMaster::Quoted(std::string path) const {
  FormatPathString(path);
  return path;
}

std::string TAVMaster::PortableUpdateFolder() const { return portablePath + kFileSeparator + "update"; }

void TAVMaster::EnsureDirectory(const std::string& path, const char* traced_by) const {
  if (DirExists(path)) return;
  const std::string command = MKDIR + kSpaceSeparator + path + kSpaceSeparator + OutputToNULL;
  if (traced_by != nullptr) DebugLog("[Status:]%s: command = %s", traced_by, command.c_str());
  RunInShell(command);
}

}  // namespace NZEMRUVTAV
