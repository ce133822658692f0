#ifndef RUV_LAUNCHER_SIGNALS_H
#define RUV_LAUNCHER_SIGNALS_H

namespace NZEMRUVTAV {

// Makes the run independent of how its parent left the signals, and of where its output goes:
// - SIGCHLD gets its default back: ignored, as some daemons leave it, it would hide every exit status from system().
// - SIGPIPE and SIGXFSZ no longer end the launcher between two steps when the console is closed or a file-size limit
//   is met. They get an empty handler instead of being ignored, so that the programs it runs start with the default.
void PrepareSignals();

}  // namespace NZEMRUVTAV

#endif  // RUV_LAUNCHER_SIGNALS_H
