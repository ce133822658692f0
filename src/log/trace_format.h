// The path and the line format of the trace file, shared by the launcher and ruv-trace.
#pragma once

#include <cstddef>

namespace NZEMRUVTAV {

inline constexpr const char* kLogDirectory = "/var/log/ZEM_Support";
inline constexpr const char* kLogFile = "ruvtav.log";
inline constexpr const char* kLinePrefix = "[TAVRUV]: ";
inline constexpr std::size_t kMessageBufferSize = 512;  // bytes, the terminating NUL included

}  // namespace NZEMRUVTAV
