#ifndef RUV_TRACE_PASSWORDS_H
#define RUV_TRACE_PASSWORDS_H

#include <string>
#include <string_view>

namespace ruv_trace {

// Returns the command with *** for each password: everything after --proxy-password=; and after the first -t,
// --ipmi-lan,
// --vmware-esxi or --remote-zfld with user:password@host, everything from the first colon to the last @. Where an
// argument ends cannot be told from the command, so other arguments may be hidden as well.
std::string WithoutPasswords(std::string_view command);

}  // namespace ruv_trace

#endif  // RUV_TRACE_PASSWORDS_H
