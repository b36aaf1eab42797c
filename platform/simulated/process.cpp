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
// is opened next.
void TakeStandardStreams() {
  int descriptor;
  do {
    descriptor = open("/dev/null", O_RDONLY);
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

// Blocked in the main thread before there is another, they never interrupt a pause of the activity.
void TakeSignals() {
  pthread_sigmask(SIG_BLOCK, &WaitedFor(), nullptr);
  signal(SIGPIPE, SIG_IGN);
  signal(SIGXFSZ, SIG_IGN);
}

}  // namespace

const Scenario &TakeProcess() {
  static const bool taken = (TakeStandardStreams(), TakeSignals(), true);
  static_cast<void>(taken);
  try {
    if (const Scenario *scenario = TheScenario()) return *scenario;
  } catch (const std::bad_alloc &) {
    EndWithoutMemory();
  }
  std::exit(2);
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
