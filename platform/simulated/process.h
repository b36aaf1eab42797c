// The process of a daemon: its standard streams and its signals. Driver functions leave both alone,
// so that a tool keeps its own.
#ifndef PLATFORM_SIMULATED_PROCESS_H
#define PLATFORM_SIMULATED_PROCESS_H

#include "platform/simulated/scenario.h"

namespace simulated {

// What every function begins with that only a daemon calls, on its main thread at first. The first
// call takes the process over: nothing else becomes descriptor 0, 1 or 2, and SIGPIPE and SIGXFSZ
// mean nothing. Then it loads the scenario, without which the process ends with status 2; until
// that is done any other signal ends it too. From then on SIGTERM, SIGINT, SIGHUP and SIGUSR1 wait
// for WaitToStop.
const Scenario &TakeProcess();

// Ends the process for want of memory or of threads: one line, and status 2.
[[noreturn]] void EndWithoutMemory();

// Takes the signals that came before there was a run: true when one of them asks to stop. One to
// yield means nothing then.
bool StopCameEarly();

// Waits for a signal: true when it asks the process to stop, false when it asks the activity to
// yield.
bool WaitToStop();

// What SIGTERM does.
void Stop();

}  // namespace simulated

#endif
