// The fixed words of the commands that the launcher runs through the shell.
#pragma once

#include <string>

namespace NZEMRUVTAV {

// The package tool's verbs.
inline const std::string TAVTOOL_CMD_COMPWEB = "compareweb";
inline const std::string TAVTOOL_CMD_COMPLOC = "comparelocal";
inline const std::string TAVTOOL_CMD_ACQUIRE = "acquire";
inline const std::string TAVTOOL_CMD_COPY = "copy";
inline const std::string TAVTOOL_CMD_EXPAND = "expand";

inline const std::string kFileSeparator = "/";
inline const std::string kSpaceSeparator = " ";

inline const std::string OutputToNULL = "1>/dev/null 2>&1";
inline const std::string kToolOutputFile = "tav.log";  // relative to the current directory
inline const std::string OutputToLog = "1>" + kToolOutputFile + " 2>&1";

inline const std::string MKDIR = "mkdir -p";
inline const std::string COPYSCRIPT = "copy.sh";

}  // namespace NZEMRUVTAV
