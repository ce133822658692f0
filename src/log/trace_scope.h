#ifndef RUV_LOG_TRACE_SCOPE_H
#define RUV_LOG_TRACE_SCOPE_H

#include <exception>
#include <string>

#include "launcher/tav.h"

namespace NZEMRUVTAV {

// Writes a member's entry line when it is created and the exit line when the member returns, by whichever way. A member
// that an exception leaves gets no exit line.
class TraceScope {
 public:
  // member: the name without the parentheses; it must outlive the scope.
  TraceScope(const TAVMaster& session, const char* member)
      : TraceScope(session, member, std::string("[Debug:] Entering TAVMaster::") + member + "()") {}

  // For the members whose entry line is not the usual one.
  TraceScope(const TAVMaster& session, const char* member, const std::string& entry_line)
      : session_(session), member_(member) {
    session_.DebugLog("%s", entry_line.c_str());
  }

  ~TraceScope() {
    if (std::uncaught_exceptions() == exceptions_at_entry_) {
      session_.DebugLog("[Debug:] Exiting TAVMaster::%s()", member_);
    }
  }

  TraceScope(const TraceScope&) = delete;
  TraceScope& operator=(const TraceScope&) = delete;

 private:
  const TAVMaster& session_;
  const char* member_;
  int exceptions_at_entry_ = std::uncaught_exceptions();
};

}  // namespace NZEMRUVTAV

#endif  // RUV_LOG_TRACE_SCOPE_H
