// The only way in which the launcher runs other programs.
#pragma once

#include <cstdlib>
#include <string>

namespace NZEMRUVTAV {

// Runs the command through the shell and waits for it. Returns the wait status. If no shell can be started, that is the
// status of exit code 127, as for a command that the shell does not find; -1 if waiting fails or, with C libraries
// before glibc 2.29, no process can be created.
inline int RunInShell(const std::string& command) { return std::system(command.c_str()); }

}  // namespace NZEMRUVTAV
