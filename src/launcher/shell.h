// The one way in which the launcher runs other programs.
#ifndef RUV_LAUNCHER_SHELL_H
#define RUV_LAUNCHER_SHELL_H

#include <cstdlib>
#include <string>

namespace NZEMRUVTAV {

// Runs the command through the shell and waits for it. Returns the wait status, or -1 when no shell could be run.
inline int RunInShell(const std::string& command) { return std::system(command.c_str()); }

}  // namespace NZEMRUVTAV

#endif  // RUV_LAUNCHER_SHELL_H
