// One run: find the controller, open it, ask it to carry out BDR work until none is left or the
// scheduler wants the daemon to yield, then close and defer or stop.

#include "daemon/activity_handler.h"

#include <unistd.h>

#include <cstdint>

#include "morwick/connection.h"
#include "morwick/controller.h"
#include "morwick/exporter.h"
#include "morwick/little_endian.h"

namespace {

constexpr char kActivityIdentifier[] = "org.morwick.grellon";
constexpr uint32_t kRequestArgument = 1025;  // of a task-scheduler request; platform.h
constexpr uint32_t kDeferChecks = 6;         // between two requests, one before each pause
constexpr uint32_t kPauseSeconds = 5;

// Sends one request. Returns the work that is still pending; 0 after a failed request.
uint32_t RequestWork(uint32_t connection, const NandExporter &row, const SelectorPair &selectors,
                     uint32_t iteration) {
  const MorwickRequest request = MorwickMakeRequest(&selectors, kRequestArgument);
  uint32_t reply = 0;
  size_t replySize = sizeof reply;
  const int32_t status = CallStructMethod(connection, row.methodSelector, &request, sizeof request,
                                          &reply, &replySize);
  const uint32_t bdrPending = LittleEndian32(reply);
  SystemLog("iter# %u - KVR status %s - is BDR done: %s (%u)", iteration,
            status == 0 ? "pass" : "fail", bdrPending == 0 ? "YES" : "NO", bdrPending);
  return status == 0 ? bdrPending : 0;
}

// Lets the controller and the host rest before the next request. Returns false when the scheduler
// wants the daemon to yield. It is not asked after the last pause.
bool PauseUnlessDeferred(Activity *activity) {
  for (uint32_t check = 1; check <= kDeferChecks; ++check) {
    if (ActivityShouldDefer(activity)) {
      SystemLog("  - defer chck %u/%u - deferring!!!!", check, kDeferChecks);
      return false;
    }
    SystemLog("  - defer chck %u/%u - sleeping for %us", check, kDeferChecks, kPauseSeconds);
    sleep(kPauseSeconds);
  }
  return true;
}

// Returns the work that is still pending; 0 when there is no more, or a request failed.
uint32_t RequestUntilDoneOrDeferred(Activity *activity, uint32_t connection,
                                    const NandExporter &row, const SelectorPair &selectors) {
  for (uint32_t iteration = 1;; ++iteration) {
    SystemLog("iter# %u - BEGIN", iteration);
    const uint32_t bdrPending = RequestWork(connection, row, selectors, iteration);
    if (bdrPending == 0) {
      SystemLog("iter# %u - DONE - no more BDR", iteration);
      return 0;
    }
    if (!PauseUnlessDeferred(activity)) {
      SystemLog("iter# %u - DONE for now - more BDR", iteration);
      return bdrPending;
    }
    SystemLog("iter# %u - DONE sleeping - more BDR", iteration);
  }
}

// Opens, uses and closes a connection. Returns the work still pending; 0 without a connection.
uint32_t WorkOnService(Activity *activity, uint32_t service, const NandExporter &row) {
  if (row.getTaskSchedulerSelectors == nullptr) return 0;
  const SelectorPair *selectors = row.getTaskSchedulerSelectors();
  uint32_t connection = 0;
  if (OpenService(service, kNandConnectionType, &connection) != 0 || connection == 0) return 0;
  SystemLog("opened io service connection");
  const uint32_t bdrPending = RequestUntilDoneOrDeferred(activity, connection, row, *selectors);
  SystemLog("closing io service connection");
  if (CloseService(connection) != 0) SystemLog("error closing connection to service");
  return bdrPending;
}

void EndRun(Activity *activity, uint32_t bdrPending) {
  // Ask again: the scheduler may have changed its mind since the last defer check.
  if (bdrPending != 0 && ActivityShouldDefer(activity)) {
    SystemLog("deferring grellon daemon\n");
    SetActivityState(activity, kActivityStateDefer);
  } else {
    SystemLog("stopping grellon daemon\n");
  }
  ExitTransactionClean();
}

}  // namespace

void RegisterTaskSchedulerActivity() {
  RegisterActivity(kActivityIdentifier, kActivityCheckIn, TaskSchedulerActivityHandler);
}

void TaskSchedulerActivityHandler(Activity *activity) {
  if (GetActivityState(activity) != kActivityStateRun) return;
  SystemLog("running grellon");
  NandExporter *row = nullptr;
  uint32_t bdrPending = 0;
  if (const uint32_t service = findNandExporter(&row); service != 0) {
    bdrPending = WorkOnService(activity, service, *row);
    ReleaseObject(service);
  }
  EndRun(activity, bdrPending);
}
