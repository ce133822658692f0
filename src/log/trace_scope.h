#pragma once

#include <exception>
#include <string>

#include "launcher/tav.h"

namespace NZEMRUVTAV {

// Traces a member's entry on construction and its exit on destruction, unless an exception is leaving the member.
class TraceScope {
 public:
  // member: the name without the parentheses, that is, __func__; it must outlive the scope.
  TraceScope(const TAVMaster& session, const char* member) : session_(session), member_(member) {
    session_.DebugLog("[Debug:] Entering TAVMaster::%s()", member_);
  }

  // For members with an entry line of their own.
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
