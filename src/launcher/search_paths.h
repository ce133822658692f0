#pragma once

namespace NZEMRUVTAV {

// Appends the vendor directories to LD_LIBRARY_PATH and PATH of this process, and so of every command that it runs.
// They are relative to the current directory of the process that uses them.
void ExtendSearchPaths();

}  // namespace NZEMRUVTAV
