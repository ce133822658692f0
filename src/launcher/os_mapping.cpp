#include "launcher/tav.h"
#include "log/trace_scope.h"

namespace NZEMRUVTAV {
namespace {

struct OperatingSystemCodes {
  int first;
  int last;
  const char* name;  // in the package tool's vocabulary
};

constexpr OperatingSystemCodes kOperatingSystems[] = {
    {0, 0, "NONE"},         {1, 1, "vmware"},       {2, 2, "yev"},          {101, 110, "windows"},
    {201, 201, "rhel3"},    {202, 202, "rhel4"},    {203, 203, "rhel5"},    {204, 204, "sles8"},
    {205, 205, "sles9"},    {206, 206, "sles10"},   {207, 207, "sles11"},   {208, 208, "rhel6"},
    {301, 301, "vmware20"}, {302, 302, "vmware30"}, {303, 303, "vmware35"}, {304, 304, "vmware40"},
};

}  // namespace

void TAVMaster::OSMapping(int code) {
  const TraceScope trace(*this, __func__, "[Debug:] Entering TAVMaster::OSMapping(), code = " + std::to_string(code));
  for (const OperatingSystemCodes& system : kOperatingSystems) {
    if (system.first <= code && code <= system.last) {
      operatingSystemType = system.name;
      return;
    }
  }
}

}  // namespace NZEMRUVTAV
