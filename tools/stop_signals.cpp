// Signals that ask a command to stop.

#include "tools/stop_signals.h"

#include <algorithm>
#include <cstdlib>

namespace tools {

using std::chrono::nanoseconds;
using std::chrono::steady_clock;

volatile sig_atomic_t StopSignals::stopped_ = 0;
volatile sig_atomic_t StopSignals::redraw_ = 0;

StopSignals::StopSignals() {
  struct sigaction action = {};
  sigemptyset(&signals_);
  action.sa_handler = [](int signal) { redraw_ = signal; };
  for (const int signal : {SIGWINCH, SIGCONT}) {
    sigaction(signal, &action, nullptr);
    sigaddset(&signals_, signal);
  }
  action.sa_handler = [](int signal) { stopped_ = signal; };
  action.sa_flags = static_cast<int>(SA_RESETHAND);
  for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
    struct sigaction before = {};
    sigaction(signal, nullptr, &before);
    if (signal == SIGHUP && before.sa_handler == SIG_IGN) continue;
    sigaction(signal, &action, nullptr);
    sigaddset(&signals_, signal);
  }
}

StopSignals::End StopSignals::WaitUntil(steady_clock::time_point moment, Output &output) {
  sigset_t before;
  sigprocmask(SIG_BLOCK, &signals_, &before);  // none is lost between the check and the wait
  bool hasReader = true;
  redraw_ = 0;
  int64_t left = 1;  // nanoseconds; the loop runs once even when the moment has passed
  while (stopped_ == 0 && redraw_ == 0 && hasReader && left > 0) {
    left = std::max(nanoseconds(moment - steady_clock::now()).count(), int64_t{0});
    hasReader = output.WaitWithReader({left / 1000000000, left % 1000000000}, before);
  }
  sigprocmask(SIG_SETMASK, &before, nullptr);
  if (stopped_ != 0 || !hasReader) return End::kStopped;
  if (redraw_ == SIGCONT) return End::kContinued;
  return redraw_ != 0 ? End::kResized : End::kTime;
}

void StopSignals::EndProcess() {
  std::signal(stopped_, SIG_DFL);
  std::raise(stopped_);
  std::abort();  // reached only when no signal has arrived
}

}  // namespace tools
