// The only way in which the launcher runs other programs.
#pragma once

#include <cstdlib>
#include <string>

namespace NZEMRUVTAV {

// Runs the command through the shell and waits for it. Returns the wait status; if no shell can be started, that of
// exit code 127, as if the shell had not found the command. Returns -1 if waiting fails or, before glibc 2.29, if no
// process can be created.
inline int RunInShell(const std::string& command) { return std::system(command.c_str()); }

}  // namespace NZEMRUVTAV
