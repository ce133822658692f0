#include <cxxabi.h>

#include <cstdlib>
#include <exception>
#include <memory>
#include <typeinfo>

#include "launcher/console.h"
#include "launcher/search_paths.h"
#include "launcher/signals.h"
#include "launcher/tav.h"

namespace {

// Ends the process with one line and status 1, instead of an abort and a core file. A plain std::exception
// means an unknown directory. Anything else is a lack of memory; the type is null if not even it could be created.
[[noreturn]] void ReportUncaughtException() {
  const std::type_info* type = abi::__cxa_current_exception_type();
  const bool directory_is_unknown = type != nullptr && *type == typeid(std::exception);
  NZEMRUVTAV::PrintLine(directory_is_unknown
                            ? "ERROR: Unable to find the directory of the RUV launcher, RUV is not started."
                            : "ERROR: Not enough memory, RUV launcher ends.");
  std::_Exit(EXIT_FAILURE);
}

// Runs before the constructors of the static strings, for which memory may run out as well.
[[gnu::constructor(101)]] void InstallTerminateHandler() { std::set_terminate(ReportUncaughtException); }

// Creates the session and runs it. An exception passes through a handler here because otherwise the process
// would end without unwinding the stack, that is, without the session's destructor.
int RunSession(int argc, char** argv) {
  try {
    const auto session = std::make_unique<NZEMRUVTAV::TAVMaster>();
    return session->TAVMasterMain(argc, argv);
  } catch (...) {
    throw;
  }
}

}  // namespace

int main(int argc, char** argv) {
  NZEMRUVTAV::PrepareSignals();
  NZEMRUVTAV::ExtendSearchPaths();
  return RunSession(argc, argv);
}
