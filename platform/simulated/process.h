// The process of a daemon: its standard streams and its signals. Driver functions leave both alone,
// so that a tool keeps its own.
#ifndef PLATFORM_SIMULATED_PROCESS_H
#define PLATFORM_SIMULATED_PROCESS_H

#include "platform/simulated/scenario.h"

namespace simulated {

// RegisterActivity, RunMainQueue and SystemLog call this function first. The first call must come
// from the main thread and takes over the process: no file that is opened later becomes descriptor
// 0, 1 or 2, and SIGPIPE and SIGXFSZ are ignored. Then it loads the scenario; a bad file ends the
// process with status 2. From then on SIGTERM, SIGINT, SIGHUP and SIGUSR1 are blocked, and the two
// functions below take them.
const Scenario &TakeProcess();

// Takes the signals that came before the first run. True when one of them asks to stop; SIGUSR1 has
// nothing to interrupt yet and is dropped.
bool StopCameEarly();

// Waits for a signal. True when it asks the process to stop, false when it asks the activity to
// yield.
bool WaitForSignal();

// Sends SIGTERM to this process, so that WaitForSignal ends in the main thread.
void Stop();

// Ends the process with one line and status 2, because memory or a thread was refused.
[[noreturn]] void EndWithoutMemory();

}  // namespace simulated

#endif
