// Signals that ask a command to stop. The command takes them between two pieces of work.
#ifndef TOOLS_STOP_SIGNALS_H
#define TOOLS_STOP_SIGNALS_H

#include <chrono>
#include <csignal>

#include "tools/output.h"

namespace tools {

// Once there is one, SIGINT, SIGTERM and SIGHUP are remembered, so that the output ends with a
// whole line. A second signal of the same kind ends the process, even when it hangs. SIGHUP stays
// ignored if it was ignored (by nohup). SIGINT does not stay ignored: shells ignore it for all
// background jobs. A change of the window's size (SIGWINCH) and a return from the background
// (SIGCONT) are remembered too.
class StopSignals {
 public:
  StopSignals();

  // The signal that arrived, or 0.
  static int Stopped() { return stopped_; }

  enum class End { kTime, kResized, kContinued, kStopped };

  // Waits until the moment, until a signal arrives, or until the reader of the output has gone
  // away, which is kStopped too.
  End WaitUntil(std::chrono::steady_clock::time_point moment, Output &output);

  // Ends the process by the signal that arrived; one must have arrived.
  [[noreturn]] static void EndProcess();

 private:
  static volatile sig_atomic_t stopped_;
  static volatile sig_atomic_t redraw_;  // the signal that asks to draw again, or 0
  sigset_t signals_;
};

}  // namespace tools

#endif
