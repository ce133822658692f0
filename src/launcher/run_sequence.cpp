// The driver: the order of the steps in update mode and in launch mode.
#include "launcher/command_fragments.h"
#include "launcher/console.h"
#include "launcher/tav.h"
#include "log/trace_scope.h"
#include "packages/exit_code_tables.h"

namespace NZEMRUVTAV {

int TAVMaster::TAVMasterMain(int argc, char** argv) {
  const TraceScope trace(*this, __func__);
  ParseParameters(argc, argv);
  if (checkUpdate || doUpdate) {
    RunUpdateMode();
  } else {
    RunLaunchMode();
  }
  return 0;
}

void TAVMaster::RunUpdateMode() {
  PrintLine("Detecting available update on internet, please wait...");
  if (CheckUpdate() != kSuccess) return;
  if (checkUpdate) {
    PrintLine("There's new update for this system, use --update to download");
    return;
  }
  Print("RUV update(s) detected, start downloading...");
  if (AcquireUpdate() != kSuccess) {
    PrintLine("Failed");
    return;
  }
  // A portable installation keeps the package on its media, where later runs on any machine import it.
  if (!isPortableRUV() && CompareTAVPackage(GetRepositoryPath(), GetWorkingPath()) == kPackageToInstall) {
    InstallRepositoryPackage();
  }
  PrintLine("Done");
}

void TAVMaster::RunLaunchMode() {
  if (!isIgnoreTAVPackage()) {
    if (isPortableRUV()) CopyPortableTAVToRepository();
    if (DirExists(GetRepositoryPath()) &&
        CompareTAVPackage(GetRepositoryPath(), GetWorkingPath()) == kPackageToInstall) {
      PrintLine("Discovered RUV update(s) in local drive for this system.");
      InstallRepositoryPackage();
    }
  }
  // Only now: the installation adds this machine's type to the support list.
  const bool warn_unsupported = NeedsSupportWarning();
  std::string application_path = GetWorkingPath() + kFileSeparator + "ruv";
  FormatPathString(application_path);
  InvokeRUV(application_path, passThroughParams, warn_unsupported);
}

void TAVMaster::InstallRepositoryPackage() {
  if (DecompressTAV(GetRepositoryPath(), GetUncompressedPath()) == kSuccess) UpdateSupportList();
}

// True if the machine type is not supported and it matters: no input file, no remote target, not a pre-installation
// environment.
bool TAVMaster::NeedsSupportWarning() const {
  if (isSystemInSupportList() || inputFileGiven || isIgnoreTAVPackage()) return false;
  return !IsWinPE3_X();
}

}  // namespace NZEMRUVTAV
