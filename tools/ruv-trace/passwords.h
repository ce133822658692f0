#ifndef RUV_TRACE_PASSWORDS_H
#define RUV_TRACE_PASSWORDS_H

#include <string>
#include <string_view>

namespace ruv_trace {

// Returns the command with *** for each password: what follows --proxy-password=, and the middle of user:password@host
// after -t, --ipmi-lan, --vmware-esxi and --remote-zfld. Hides too much rather than too little, also where the command
// was cut or is quoted in strange ways.
std::string WithoutPasswords(std::string_view command);

}  // namespace ruv_trace

#endif  // RUV_TRACE_PASSWORDS_H
