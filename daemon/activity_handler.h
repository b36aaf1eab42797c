// The background activity: what the scheduler runs to let the controller do its pending BDR work.
#ifndef DAEMON_ACTIVITY_HANDLER_H
#define DAEMON_ACTIVITY_HANDLER_H

#include "morwick/platform.h"

extern "C" {

// Registers the activity; the platform calls the handler from then on.
void RegisterTaskSchedulerActivity();

// Does one run of the activity if it is in the run state, otherwise nothing. Blocks in driver calls
// and sleeps; keeps no state from one run to the next.
void TaskSchedulerActivityHandler(Activity *activity);
}

#endif
