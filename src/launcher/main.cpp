#include <cstdlib>
#include <exception>
#include <memory>
#include <new>

#include "launcher/console.h"
#include "launcher/search_paths.h"
#include "launcher/signals.h"
#include "launcher/tav.h"

namespace {

int RunLauncher(int argc, char** argv) {
  NZEMRUVTAV::ExtendSearchPaths();
  const auto session = std::make_unique<NZEMRUVTAV::TAVMaster>();
  return session->TAVMasterMain(argc, argv);
}

}  // namespace

// An exception that leaves a run ends the process with one line on standard output and status 1, after the session is
// released, rather than with an abort and a core file.
int main(int argc, char** argv) {
  NZEMRUVTAV::PrepareSignals();
  try {
    return RunLauncher(argc, argv);
  } catch (const std::bad_alloc&) {
    NZEMRUVTAV::PrintLine("ERROR: Not enough memory, RUV launcher ends.");
  } catch (const std::exception&) {
    // The one exception that the launcher throws itself, and it carries no text.
    NZEMRUVTAV::PrintLine("ERROR: Unable to find the directory of the RUV launcher, RUV is not started.");
  }
  return EXIT_FAILURE;
}
