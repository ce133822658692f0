// The meaning of the package tool's exit codes, for the launcher and for ruv-trace.
#pragma once

namespace NZEMRUVTAV {

// Results of a package step.
inline constexpr int kSuccess = 0;
inline constexpr int kFailure = 1;  // every code that is not in kToolResults
inline constexpr int kPackageToInstall = 2;
inline constexpr int kNoPayload = 3;

struct ToolResult {
  int exit_code;
  int result;
};

inline constexpr ToolResult kToolResults[] = {
    {32, kSuccess}, {0, kSuccess}, {21, kPackageToInstall}, {52, kNoPayload}, {61, kNoPayload}};

struct ErrMsg {
  int exit_code;
  const char* message;  // without a final line feed
};

inline constexpr ErrMsg ErrMsgs[] = {
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

// Returns the result of a package step.
inline int ResultOf(int exit_code) {
  for (const ToolResult& known : kToolResults) {
    if (known.exit_code == exit_code) return known.result;
  }
  return kFailure;
}

// Returns the message of a known error, or "".
inline const char* MessageOf(int exit_code) {
  for (const ErrMsg& known : ErrMsgs) {
    if (known.exit_code == exit_code) return known.message;
  }
  return "";
}

}  // namespace NZEMRUVTAV
