// What the package tool's exit codes mean, to the calling step and to the user.
#include <cstdlib>

#include "launcher/console.h"
#include "launcher/tav.h"

namespace NZEMRUVTAV {
namespace {

struct ToolResult {
  int exit_code;
  int result;
};

// The codes that are no error. Results: 0 success, 2 a package to install, 3 no payload.
constexpr ToolResult kToolResults[] = {{32, 0}, {0, 0}, {21, 2}, {52, 3}, {61, 3}};
constexpr int kFailure = 1;

struct ErrMsg {
  int exit_code;
  const char* message;  // without a final line feed
};

constexpr ErrMsg ErrMsgs[] = {
    {1, "Invalid command parameter specified."},
    {30, "You already have the latest version RUV."},
    {31, "There's no update available for this system on internet currently."},
    {33, "There's no update available for this system on internet currently."},
    {40, "There's no update available for this system on internet currently."},
    {41, "Server Response Error.\nRUV can not acquire update from website currently."},
    {42, "Unable to connect to update website.\nPlease check network connection and settings."},
    {45, "Couldn't ping KRO, maybe the KRO is down."},
    {51,
     "Error, package corrupted or not enough free space on disk.\n"
     "Ensure that there is enough system disk space and have written permissions."},
    {60,
     "Error, package corrupted or not enough free space on disk.\n"
     "Ensure that there is enough system disk space and have written permissions.."},
    {255,
     "Internal Error.\nPlease check your network environment and try again.\n"
     "If you need to access internet through proxy, please use --proxy and try again."},
};

// The wait status of a shell that the interrupt signal (2) ended. A tool that exits with code 2 has status 512.
constexpr int kInterruptedStatus = 2;

}  // namespace

int TAVMaster::HandleTAVToolReturnValue(int status) const {
  if (status == kInterruptedStatus) {
    PrintLine("RUV application is determined by the user!");
    std::exit(EXIT_FAILURE);
  }
  // Not WEXITSTATUS: a system() failure, -1, must stay -1.
  const int exit_code = status >> 8;
  DebugLog("[Status:]Return Code from tavtool = %d", exit_code);
  for (const ToolResult& known : kToolResults) {
    if (known.exit_code == exit_code) return known.result;
  }
  for (const ErrMsg& known : ErrMsgs) {
    if (known.exit_code == exit_code) {
      PrintLine(known.message);
      DebugLog("%s", known.message);
      break;
    }
  }
  return kFailure;
}

}  // namespace NZEMRUVTAV
