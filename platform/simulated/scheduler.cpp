// The background-activity scheduler and the main queue. A worker thread checks the activity in and
// runs it on schedule; the main thread waits for signals.

#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <thread>

#include "morwick/platform.h"
#include "platform/simulated/process.h"

// The process has one activity. Its handler runs on the worker thread and calls the platform there.
struct Activity {
  ActivityHandler handler = nullptr;
  int state = 0;
  uint32_t checksToYield = 0;  // checks left until the run is asked to yield; 0 for never
  bool inTransaction = false;

  std::mutex mutex;  // guards all members below, which the main thread sets too
  std::condition_variable wakeUp;
  bool yieldWanted = false;
  bool stopping = false;
};

namespace simulated {
namespace {

// States beside the two of the contract.
constexpr int kActivityStateCheckIn = 0;
constexpr int kActivityStateWait = 1;
constexpr int kActivityStateDone = 5;

Activity theActivity;

// Calls the handler with the activity in that state.
void CallHandler(int state, uint32_t checksToYield) {
  theActivity.state = state;
  theActivity.checksToYield = checksToYield;
  theActivity.inTransaction = state == kActivityStateRun;
  {
    const std::lock_guard lock(theActivity.mutex);
    theActivity.yieldWanted = theActivity.stopping;
  }
  theActivity.handler(&theActivity);
}

// True when the activity was deferred and is to be resumed.
bool RunActivity(uint32_t checksToYield) {
  CallHandler(kActivityStateRun, checksToYield);
  if (theActivity.inTransaction) std::fputs("the run did not end its transaction\n", stderr);
  const bool deferred = theActivity.state == kActivityStateDefer;
  theActivity.state = deferred ? kActivityStateWait : kActivityStateDone;
  return deferred;
}

// Waits for the delay. False when the process is to stop before it has passed.
bool WaitFor(std::chrono::milliseconds delay) {
  std::unique_lock lock(theActivity.mutex);
  return !theActivity.wakeUp.wait_for(lock, delay, [] { return theActivity.stopping; });
}

// Runs the activity until the schedule ends or a signal asks to stop.
void RunSchedule(const Schedule &schedule) {
  if (theActivity.handler == nullptr) return;
  CallHandler(kActivityStateCheckIn, 0);
  auto delay = schedule.firstRunAfter;
  size_t run = 0;
  for (uint32_t left = schedule.runs; left > 0 && WaitFor(delay); ++run) {
    const auto &deferAt = schedule.deferAtCheck;
    if (RunActivity(run < deferAt.size() ? deferAt[run] : 0)) {
      delay = schedule.resumeAfter;
    } else {
      delay = schedule.interval;
      --left;
    }
  }
}

// Waits for signals while a thread runs the schedule.
void Run(const Schedule &schedule) {
  theActivity.stopping = StopCameEarly();
  const std::jthread worker([&] {
    RunSchedule(schedule);
    Stop();  // at the end of the schedule the main queue ends as by SIGTERM
  });
  for (bool stop = false; !stop;) {
    stop = WaitForSignal();
    const std::lock_guard lock(theActivity.mutex);
    // Between two runs a wish to yield has no effect: CallHandler clears it.
    theActivity.yieldWanted = true;
    theActivity.stopping = theActivity.stopping || stop;
    theActivity.wakeUp.notify_all();
  }
}

}  // namespace
}  // namespace simulated

using simulated::theActivity;

void RegisterActivity(const char *, ActivityCriteria criteria, ActivityHandler handler) {
  simulated::TakeProcess();
  if (criteria == kActivityCheckIn) theActivity.handler = handler;
}

int GetActivityState(Activity *activity) { return activity->state; }

// Once true, the answer stays true until the run ends.
bool ActivityShouldDefer(Activity *activity) {
  const std::lock_guard lock(activity->mutex);
  if (activity->checksToYield > 0 && --activity->checksToYield == 0) activity->yieldWanted = true;
  return activity->yieldWanted;
}

bool SetActivityState(Activity *activity, int state) {
  if (state != kActivityStateDefer || activity->state != kActivityStateRun) return false;
  activity->state = state;
  return true;
}

void ExitTransactionClean() { theActivity.inTransaction = false; }

void RunMainQueue() {
  const simulated::Schedule &schedule = simulated::TakeProcess().schedule;
  // The library prints lines too. With a buffer for each line they stand among those of the log.
  std::setvbuf(stdout, nullptr, _IOLBF, 0);
  try {
    simulated::Run(schedule);
  } catch (...) {
    simulated::EndWithoutMemory();  // the worker thread could not be made
  }
  std::exit(EXIT_SUCCESS);
}
