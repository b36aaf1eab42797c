// The background-activity scheduler and the main queue. A worker thread checks the activity in and
// runs it on schedule; the main thread waits for signals.

#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <thread>

#include "morwick/platform.h"
#include "platform/simulated/process.h"

struct Activity {
  ActivityHandler handler = nullptr;
  int state = 0;
};

namespace simulated {
namespace {

constexpr int kActivityStateCheckIn = 0;
constexpr int kActivityStateWait = 1;
constexpr int kActivityStateDone = 5;

class Scheduler {
 public:
  static Scheduler &Instance() {
    static Scheduler scheduler;
    return scheduler;
  }

  void Register(ActivityHandler handler) { activity_.handler = handler; }

  int State(const Activity &activity) {
    const std::lock_guard lock(mutex_);
    return activity.state;
  }

  bool SetState(Activity &activity, int state) {
    const std::lock_guard lock(mutex_);
    if (state != kActivityStateDefer || activity.state != kActivityStateRun) return false;
    activity.state = state;
    return true;
  }

  // Once true, the answer stays true until the run ends.
  bool ShouldDefer() {
    const std::lock_guard lock(mutex_);
    ++questions_;
    if (deferAtCheck_ != 0 && questions_ >= deferAtCheck_) yieldWanted_ = true;
    return yieldWanted_;
  }

  void EndTransaction() {
    const std::lock_guard lock(mutex_);
    inTransaction_ = false;
  }

  // Runs the activity until the schedule ends or a signal asks to stop.
  void Run(const Schedule &schedule) {
    stopping_ = StopCameEarly();
    std::thread worker([&] {
      RunSchedule(schedule);
      Stop();  // at the end of the schedule the main queue ends as by SIGTERM
    });
    bool stop;
    do {
      stop = WaitToStop();
      const std::lock_guard lock(mutex_);
      yieldWanted_ = true;  // between two runs nothing yields, and Enter forgets the wish
      stopping_ = stopping_ || stop;
      wakeUp_.notify_all();
    } while (!stop);
    worker.join();
  }

 private:
  void RunSchedule(const Schedule &schedule) {
    if (activity_.handler == nullptr) return;
    Enter(kActivityStateCheckIn);
    activity_.handler(&activity_);
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

  // True when the activity was deferred and is to be resumed.
  bool RunActivity(uint32_t deferAtCheck) {
    Enter(kActivityStateRun, deferAtCheck);
    activity_.handler(&activity_);
    const std::lock_guard lock(mutex_);
    if (inTransaction_) std::fputs("the run did not end its transaction\n", stderr);
    const bool deferred = activity_.state == kActivityStateDefer;
    activity_.state = deferred ? kActivityStateWait : kActivityStateDone;
    return deferred;
  }

  void Enter(int state, uint32_t deferAtCheck = 0) {
    const std::lock_guard lock(mutex_);
    activity_.state = state;
    deferAtCheck_ = deferAtCheck;
    questions_ = 0;
    inTransaction_ = state == kActivityStateRun;
    yieldWanted_ = stopping_;
  }

  // False when the process is to stop instead.
  bool WaitFor(std::chrono::milliseconds delay) {
    std::unique_lock lock(mutex_);
    return !wakeUp_.wait_for(lock, delay, [this] { return stopping_; });
  }

  std::mutex mutex_;
  std::condition_variable wakeUp_;
  Activity activity_;
  uint32_t deferAtCheck_ = 0;
  uint32_t questions_ = 0;
  bool inTransaction_ = false;
  bool yieldWanted_ = false;
  bool stopping_ = false;
};

}  // namespace
}  // namespace simulated

using simulated::Scheduler;

void RegisterActivity(const char *, ActivityCriteria criteria, ActivityHandler handler) {
  simulated::TakeProcess();
  if (criteria == kActivityCheckIn) Scheduler::Instance().Register(handler);
}

int GetActivityState(Activity *activity) { return Scheduler::Instance().State(*activity); }

bool ActivityShouldDefer(Activity *) { return Scheduler::Instance().ShouldDefer(); }

bool SetActivityState(Activity *activity, int state) {
  return Scheduler::Instance().SetState(*activity, state);
}

void ExitTransactionClean() { Scheduler::Instance().EndTransaction(); }

void RunMainQueue() {
  const simulated::Schedule &schedule = simulated::TakeProcess().schedule;
  // The lines that the library prints then appear among the lines of the log, not after all of
  // them.
  std::setvbuf(stdout, nullptr, _IOLBF, 0);
  try {
    Scheduler::Instance().Run(schedule);
  } catch (...) {
    simulated::EndWithoutMemory();  // the worker thread was refused
  }
  std::exit(EXIT_SUCCESS);
}
