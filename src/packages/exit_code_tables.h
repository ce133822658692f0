// What the package tool's exit codes mean: the tables that the launcher goes by and that ruv-trace explains a run with.
#ifndef RUV_PACKAGES_EXIT_CODE_TABLES_H
#define RUV_PACKAGES_EXIT_CODE_TABLES_H

namespace NZEMRUVTAV {

struct ToolResult {
  int exit_code;
  int result;
};

// The codes that are no error. Results: 0 success, 2 a package to install, 3 no payload.
inline constexpr ToolResult kToolResults[] = {{32, 0}, {0, 0}, {21, 2}, {52, 3}, {61, 3}};

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

}  // namespace NZEMRUVTAV

#endif  // RUV_PACKAGES_EXIT_CODE_TABLES_H
