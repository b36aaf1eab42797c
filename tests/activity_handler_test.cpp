// The activity handler against a scripted platform: every way a run can end, call by call.

#include "daemon/activity_handler.h"

#include <gtest/gtest.h>

#include "morwick/exporter.h"
#include "tests/fake_platform.h"

namespace {

void Handle() { TaskSchedulerActivityHandler(nullptr); }

TEST(ActivityHandlerTest, EndsEachRunAsItShould) {
  const NandExporter originalRow = nand_exporters[0];
  const SelectorPair originalPair = taskSchedulerSelectors;
  PlayCases("activity_handler.txt", [&](Script &script) {
    if (script.contains("without task scheduler")) {
      nand_exporters[0].getTaskSchedulerSelectors = nullptr;
    }
    if (script.contains("other numbers")) {
      nand_exporters[0].methodSelector = 7;
      taskSchedulerSelectors = {50, 51};
    }
    script.contains("at check-in") ? RegisterTaskSchedulerActivity() : Handle();
    if (script.contains("again")) Handle();
    nand_exporters[0] = originalRow;
    taskSchedulerSelectors = originalPair;
  });
}

TEST(ActivityHandlerTest, EndsEveryRunWhateverFails) {
  Script script = {{"present", "VeltoQRN3NVMeController KVRStorage"}, {"replies", "3 2 1 0"}};
  for (const char *defers : {"", "no yes yes", "yes"}) {
    script["defers"] = defers;
    for (const std::string &outcome : PlayEveryFailure(script, Handle)) {
      EXPECT_TRUE(outcome.ends_with("log stopping grellon daemon\n\nexit clean\n") ||
                  outcome.ends_with("log deferring grellon daemon\n\nset state 3\nexit clean\n"))
          << outcome;
    }
  }
}

TEST(ActivityHandlerTest, CountsIterationsWithoutEnd) {
  std::string replies;
  for (int i = 0; i < 70000; ++i) replies += "1 ";  // more than 16 bits count
  const std::string outcome = Play({{"present", "KVRStorage"}, {"replies", replies + "0"}}, Handle);
  EXPECT_NE(outcome.find("log iter# 70001 - DONE - no more BDR\n"), std::string::npos);
}

}  // namespace
