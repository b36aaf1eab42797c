// Takes over the process of a daemon.

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

// A write to a stream that was closed at the start must fail, and must not go to the next file that
// is opened. Without /dev/null the root folder takes its place: nobody can write to it either.
void TakeStandardStreams() {
  int descriptor;
  do {
    descriptor = open("/dev/null", O_RDONLY);
    if (descriptor < 0) descriptor = open("/", O_RDONLY);
  } while (descriptor >= 0 && descriptor <= STDERR_FILENO);
  if (descriptor >= 0) close(descriptor);
}

// The signals that this file waits for.
const sigset_t &Signals() {
  static const sigset_t signals = [] {
    sigset_t set;
    sigemptyset(&set);
    for (const int signal : {SIGUSR1, SIGTERM, SIGINT}) sigaddset(&set, signal);
    // nohup starts a process with SIGHUP ignored, so that it goes on when the terminal is closed.
    struct sigaction hangup = {};
    sigaction(SIGHUP, nullptr, &hangup);
    if (hangup.sa_handler != SIG_IGN) sigaddset(&set, SIGHUP);
    return set;
  }();
  return signals;
}

const Scenario &Take() {
  TakeStandardStreams();
  // These two must not end the daemon: the write that fails reports the reason.
  signal(SIGPIPE, SIG_IGN);
  signal(SIGXFSZ, SIG_IGN);
  const Scenario *scenario = nullptr;
  try {
    scenario = TheScenario();
  } catch (const std::bad_alloc &) {
    EndWithoutMemory();
  }
  if (scenario == nullptr) std::exit(2);
  // Signals are blocked only now: the scenario may come from a pipe that stays open, and a signal
  // must end the wait for it. Threads that start later inherit the mask, so that no signal
  // interrupts the activity's sleep.
  pthread_sigmask(SIG_BLOCK, &Signals(), nullptr);
  return *scenario;
}

}  // namespace

const Scenario &TakeProcess() {
  static const Scenario &scenario = Take();
  return scenario;
}

void EndWithoutMemory() {
  Complain("out of memory");  // so short that the string takes no memory
  std::exit(2);
}

bool StopCameEarly() {
  const timespec noWait = {};
  bool stop = false;
  for (int signal; (signal = sigtimedwait(&Signals(), nullptr, &noWait)) > 0;) {
    stop = stop || signal != SIGUSR1;
  }
  return stop;
}

bool WaitForSignal() {
  int signal = 0;
  sigwait(&Signals(), &signal);
  return signal != SIGUSR1;
}

void Stop() { kill(getpid(), SIGTERM); }

}  // namespace simulated
