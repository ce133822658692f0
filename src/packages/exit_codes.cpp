// Maps the package tool's exit codes to step results and prints the messages of known errors.
#include <cstdlib>

#include "launcher/console.h"
#include "launcher/tav.h"
#include "packages/exit_code_tables.h"

namespace NZEMRUVTAV {
namespace {

// The wait status of a shell that the interrupt signal (2) ended. A tool that exits with code 2 has status 512.
constexpr int kInterruptedStatus = 2;

}  // namespace

int TAVMaster::HandleTAVToolReturnValue(int status) const {
  if (status == kInterruptedStatus) {
    PrintLine("RUV application is determined by the user!");
    std::exit(EXIT_FAILURE);
  }
  // Not WEXITSTATUS: -1, a failure of system() itself, must stay -1.
  const int exit_code = status >> 8;
  DebugLog("[Status:]Return Code from tavtool = %d", exit_code);
  const char* message = MessageOf(exit_code);
  if (*message != '\0') {
    PrintLine(message);
    DebugLog("%s", message);
  }
  return ResultOf(exit_code);
}

}  // namespace NZEMRUVTAV
