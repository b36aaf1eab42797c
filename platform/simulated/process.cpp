// Takes a daemon's process over.

#include "platform/simulated/process.h"

#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <cstdlib>
#include <ctime>
#include <new>

#include "platform/simulated/files.h"

namespace simulated {
namespace {

// What is written to a stream that was closed at the start is to fail, and not to land in whatever
// is opened next. Where there is no /dev/null the root folder does: it cannot be written either.
void TakeStandardStreams() {
  int descriptor;
  do {
    descriptor = open("/dev/null", O_RDONLY);
    if (descriptor < 0) descriptor = open("/", O_RDONLY);
  } while (descriptor >= 0 && descriptor <= STDERR_FILENO);
  if (descriptor >= 0) close(descriptor);
}

// Whoever starts a process with SIGHUP ignored, as nohup does, wants it to outlive the terminal.
bool OutlivesTerminal() {
  struct sigaction hangup = {};
  return sigaction(SIGHUP, nullptr, &hangup) == 0 && hangup.sa_handler == SIG_IGN;
}

const sigset_t &WaitedFor() {
  static const sigset_t signals = [] {
    sigset_t set;
    sigemptyset(&set);
    for (const int signal : {SIGUSR1, SIGTERM, SIGINT}) sigaddset(&set, signal);
    if (!OutlivesTerminal()) sigaddset(&set, SIGHUP);
    return set;
  }();
  return signals;
}

// Signals that mean nothing to a daemon: what cannot be written fails where it is written.
void IgnoreSignals() {
  signal(SIGPIPE, SIG_IGN);
  signal(SIGXFSZ, SIG_IGN);
}

const Scenario *LoadOrEnd() {
  try {
    if (const Scenario *scenario = TheScenario()) return scenario;
  } catch (const std::bad_alloc &) {
    EndWithoutMemory();
  }
  std::exit(2);
}

const Scenario &Take() {
  TakeStandardStreams();
  IgnoreSignals();
  // Any signal still ends the process here: the scenario may come from a pipe that stays open.
  const Scenario *scenario = LoadOrEnd();
  // Blocked in the main thread before there is another, they never interrupt a pause of the
  // activity.
  pthread_sigmask(SIG_BLOCK, &WaitedFor(), nullptr);
  return *scenario;
}

}  // namespace

const Scenario &TakeProcess() {
  static const Scenario &scenario = Take();
  return scenario;
}

void EndWithoutMemory() {
  Complain("out of memory");  // short enough to take no memory itself
  std::exit(2);
}

bool StopCameEarly() {
  const timespec now = {};
  bool stop = false;
  for (int signal; (signal = sigtimedwait(&WaitedFor(), nullptr, &now)) > 0;) {
    stop = stop || signal != SIGUSR1;
  }
  return stop;
}

bool WaitToStop() {
  int signal = 0;
  sigwait(&WaitedFor(), &signal);
  return signal != SIGUSR1;
}

void Stop() { kill(getpid(), SIGTERM); }

}  // namespace simulated
