// The path and the line format of the trace file, shared by the launcher and ruv-trace.
#ifndef RUV_LOG_TRACE_FORMAT_H
#define RUV_LOG_TRACE_FORMAT_H

#include <cstddef>

namespace NZEMRUVTAV {

inline constexpr const char* kLogDirectory = "/var/log/ZEM_Support";
inline constexpr const char* kLogFile = "ruvtav.log";
inline constexpr const char* kLinePrefix = "[TAVRUV]: ";
inline constexpr std::size_t kMessageBufferSize = 512;  // bytes, the terminating NUL included

}  // namespace NZEMRUVTAV

#endif  // RUV_LOG_TRACE_FORMAT_H
