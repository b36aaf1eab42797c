// The process of a daemon: its standard streams and its signals. Driver functions leave both alone,
// so that a tool keeps its own.
#ifndef PLATFORM_SIMULATED_PROCESS_H
#define PLATFORM_SIMULATED_PROCESS_H

#include "platform/simulated/scenario.h"

namespace simulated {

// RegisterActivity, RunMainQueue and SystemLog begin with it. The first call must come from the
// main thread and takes over the process: no file that is opened later becomes descriptor 0, 1 or
// 2, and SIGPIPE and SIGXFSZ are ignored. Then it loads the scenario; without one the process ends
// with status 2. From then on SIGTERM, SIGINT, SIGHUP and SIGUSR1 wait for WaitForSignal.
const Scenario &TakeProcess();

// Ends the process with one line and status 2, because memory or a thread was refused.
[[noreturn]] void EndWithoutMemory();

// Takes the signals that came before the first run. True when one of them asks to stop; SIGUSR1 has
// nothing to interrupt yet and is dropped.
bool StopCameEarly();

// Waits for a signal. True when it asks the process to stop, false when it asks the activity to
// yield.
bool WaitForSignal();

// Sends SIGTERM to this process, which WaitForSignal takes.
void Stop();

}  // namespace simulated

#endif
