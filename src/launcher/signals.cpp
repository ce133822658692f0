#include "launcher/signals.h"

#include <csignal>
#include <initializer_list>

namespace NZEMRUVTAV {

void PrepareSignals() {
  std::signal(SIGCHLD, SIG_DFL);
  for (const int write_signal : {SIGPIPE, SIGXFSZ}) {
    // A parent that ignores the signal wants its whole process tree to ignore it.
    if (std::signal(write_signal, [](int) {}) == SIG_IGN) std::signal(write_signal, SIG_IGN);
  }
}

}  // namespace NZEMRUVTAV
