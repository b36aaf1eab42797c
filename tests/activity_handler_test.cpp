// The activity handler against a scripted platform: every way a run can end, call by call.

#include "daemon/activity_handler.h"

#include <algorithm>

#include "morwick/exporter.h"
#include "tests/cases.h"
#include "tests/fake_platform.h"

namespace {

class ActivityHandlerTest : public PlatformTest {};

TEST_F(ActivityHandlerTest, EndsEachRunAsItShould) {
  for (const Case &run : ReadCases("activity_handler.txt")) {
    SCOPED_TRACE(run.name);
    fakePlatform.Reset(run.given);
    NandExporter &row = nand_exporters[0];
    const SelectorGetter getter = row.getTaskSchedulerSelectors;
    if (run.given.contains("without task scheduler")) row.getTaskSchedulerSelectors = nullptr;
    TaskSchedulerActivityHandler(nullptr);
    row.getTaskSchedulerSelectors = getter;
    EXPECT_EQ(fakePlatform.journal, run.expected);
    TearDown();
  }
}

// Whatever fails, alone or with any other call: nothing leaks, nothing is released twice (the
// platform sees to that), and the run ends.
TEST_F(ActivityHandlerTest, EndsEveryRunWhateverFails) {
  for (const std::string defers : {"", "no yes yes", "yes"}) {
    size_t calls = 1;
    for (size_t first = 0; first <= calls; ++first) {
      for (size_t second = first; second <= calls; ++second) {
        fakePlatform.Reset(
            {{"present", "VeltoQRN3NVMeController KVRStorage"},
             {"replies", "3 2 1 0"},
             {"defers", defers},
             {"failing", "#" + std::to_string(first) + " #" + std::to_string(second)}});
        TaskSchedulerActivityHandler(nullptr);
        calls = std::max(calls, fakePlatform.calls);
        const std::string &journal = fakePlatform.journal;
        EXPECT_TRUE(journal.ends_with("log stopping grellon daemon\n\nexit clean\n") ||
                    journal.ends_with("log deferring grellon daemon\n\nset state 3\nexit clean\n"))
            << journal;
        EXPECT_LE(fakePlatform.calls, 20U);
        TearDown();
      }
    }
  }
}

TEST_F(ActivityHandlerTest, RegistersAtCheckIn) {
  RegisterTaskSchedulerActivity();
  EXPECT_EQ(fakePlatform.journal, "register org.morwick.grellon at check-in\n");
}

}  // namespace
