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

const sigset_t &WaitedFor() {
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
  // The failing write reports these two; they must not end the daemon.
  signal(SIGPIPE, SIG_IGN);
  signal(SIGXFSZ, SIG_IGN);
  const Scenario *scenario = nullptr;
  try {
    scenario = TheScenario();
  } catch (const std::bad_alloc &) {
    EndWithoutMemory();
  }
  if (scenario == nullptr) std::exit(2);
  // Until here any signal ends the process: the scenario may come from a pipe that stays open.
  // The signals are blocked before a second thread starts. So they never interrupt the activity's
  // sleep.
  pthread_sigmask(SIG_BLOCK, &WaitedFor(), nullptr);
  return *scenario;
}

}  // namespace

const Scenario &TakeProcess() {
  static const Scenario &scenario = Take();
  return scenario;
}

void EndWithoutMemory() {
  Complain("out of memory");  // so short that the text needs no memory
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
