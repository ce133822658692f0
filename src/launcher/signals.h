#pragma once

namespace NZEMRUVTAV {

// Sets the signal dispositions of a run:
// - SIGCHLD gets its default back. If ignored, as some daemons leave it, it hides every exit status from system().
// - SIGPIPE and SIGXFSZ no longer end the launcher if the console is closed or a file-size limit is reached. Unless the
//   parent ignores them, they get an empty handler, so that programs start with the default.
// Ctrl-C (SIGINT) is left to system(), and HandleTAVToolReturnValue in packages/exit_codes.cpp ends the run.
void PrepareSignals();

}  // namespace NZEMRUVTAV
