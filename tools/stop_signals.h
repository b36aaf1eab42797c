// Signals that ask a command to stop, taken where it suits the command.
#ifndef TOOLS_STOP_SIGNALS_H
#define TOOLS_STOP_SIGNALS_H

#include <chrono>
#include <csignal>

#include "tools/io.h"

namespace tools {

// While there is one, SIGINT, SIGTERM and SIGHUP are remembered, so that what is printed stays
// whole; a second one of them ends the process even if it hangs. The end of the terminal stays
// ignored where it was (by nohup); an interrupt does not: a shell has it ignored by whatever it
// starts in the background. A change of the terminal's size is remembered too.
class StopSignals {
 public:
  StopSignals();

  // The signal that came, or 0.
  static int Stopped() { return stopped_; }

  enum class End { kTime, kResized, kStopped };

  // Waits for the moment, for a signal, or until the reader of the output has gone away.
  End WaitUntil(std::chrono::steady_clock::time_point moment, Output &output);

  // Ends the process by the signal that came.
  [[noreturn]] static void EndProcess();

 private:
  static volatile sig_atomic_t stopped_;
  static volatile sig_atomic_t resized_;
  sigset_t signals_;
};

}  // namespace tools

#endif
