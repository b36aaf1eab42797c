// The activity handler against a scripted platform: every way a run can end, call by call.

#include "daemon/activity_handler.h"

#include "morwick/exporter.h"
#include "tests/fake_platform.h"

namespace {

constexpr char kFirstClass[] = "VeltoQRN3NVMeController";
constexpr char kThirdClass[] = "KVRStorage";

// The journal's recurring stretches.
const std::string kFindAndOpen =
    "match VeltoQRN3NVMeController\nlook up = 1\nopen 1 type 0 = 2\n"
    "log opened io service connection\n";

std::string Request(int iteration, const std::string &answer, int method = 9) {
  const std::string number = std::to_string(iteration);
  return "log iter# " + number + " - BEGIN\ncall 2 method " + std::to_string(method) +
         ": 24 bytes, 39 1025 and 16 zeros\nlog iter# " + number + " - KVR status " + answer + "\n";
}

std::string Pauses(int count) {
  std::string text;
  for (int check = 1; check <= count; ++check) {
    text += "defer? no\nlog   - defer chck " + std::to_string(check) +
            "/6 - sleeping for 5s\nsleep 5\n";
  }
  return text;
}

std::string Deferring(int iteration, int check) {
  return "defer? yes\nlog   - defer chck " + std::to_string(check) + "/6 - deferring!!!!\n" +
         "log iter# " + std::to_string(iteration) + " - DONE for now - more BDR\n";
}

std::string NoMore(int iteration) {
  return "log iter# " + std::to_string(iteration) + " - DONE - no more BDR\n";
}

const std::string kClose = "log closing io service connection\nclose 2\nrelease 1\n";
const std::string kStop = "log stopping grellon daemon\n\nexit clean\n";

struct RunCase {
  const char *name;
  std::set<std::string> present;
  std::set<std::string> failing;
  std::deque<uint32_t> replies;
  std::deque<bool> deferAnswers;
  std::string journal;  // after "log running grellon"
};

class ActivityHandlerTest : public PlatformTest {};

TEST_F(ActivityHandlerTest, EndsEachRunAsItShould) {
  const RunCase cases[] = {
      {"no controller",
       {},
       {},
       {},
       {},
       "match VeltoQRN3NVMeController\nlook up = 0\nmatch VeltoEmbeddedNVMeController\n"
       "look up = 0\nmatch KVRStorage\nlook up = 0\n" +
           kStop},
      {"open refused",
       {kFirstClass},
       {"open#1"},
       {},
       {},
       "match VeltoQRN3NVMeController\nlook up = 1\nopen 1 type 0 = 0\nrelease 1\n" + kStop},
      {"open without a handle",
       {kFirstClass},
       {"handle 0"},
       {},
       {},
       "match VeltoQRN3NVMeController\nlook up = 1\nopen 1 type 0 = 0\nrelease 1\n" + kStop},
      {"nothing pending",
       {kFirstClass},
       {},
       {0},
       {},
       kFindAndOpen + Request(1, "pass - is BDR done: YES (0)") + NoMore(1) + kClose + kStop},
      {"third class",
       {kThirdClass},
       {},
       {0},
       {},
       "match VeltoQRN3NVMeController\nlook up = 0\nmatch VeltoEmbeddedNVMeController\n"
       "look up = 0\nmatch KVRStorage\nlook up = 1\nopen 1 type 0 = 2\n"
       "log opened io service connection\n" +
           Request(1, "pass - is BDR done: YES (0)", 8) + NoMore(1) + kClose + kStop},
      {"work until done",
       {kFirstClass},
       {},
       {4294967295, 1, 0},
       {},
       kFindAndOpen + Request(1, "pass - is BDR done: NO (4294967295)") + Pauses(6) +
           "log iter# 1 - DONE sleeping - more BDR\n" + Request(2, "pass - is BDR done: NO (1)") +
           Pauses(6) + "log iter# 2 - DONE sleeping - more BDR\n" +
           Request(3, "pass - is BDR done: YES (0)") + NoMore(3) + kClose + kStop},
      {"failed request with a reply",
       {kFirstClass},
       {"call#1"},
       {7},
       {true, true},
       kFindAndOpen + Request(1, "fail - is BDR done: NO (7)") + NoMore(1) + kClose + kStop},
      {"failed close",
       {kFirstClass},
       {"close#1"},
       {0},
       {},
       kFindAndOpen + Request(1, "pass - is BDR done: YES (0)") + NoMore(1) +
           "log closing io service connection\nclose 2\n"
           "log error closing connection to service\nrelease 1\n" +
           kStop},
      {"deferred at the third check",
       {kFirstClass},
       {},
       {5},
       {false, false, true, true},
       kFindAndOpen + Request(1, "pass - is BDR done: NO (5)") + Pauses(2) + Deferring(1, 3) +
           kClose + "defer? yes\nlog deferring grellon daemon\n\nset state 3\nexit clean\n"},
      {"deferral taken back",
       {kFirstClass},
       {},
       {5},
       {true, false},
       kFindAndOpen + Request(1, "pass - is BDR done: NO (5)") + Deferring(1, 1) + kClose +
           "defer? no\n" + kStop},
  };
  for (const RunCase &run : cases) {
    SCOPED_TRACE(run.name);
    fakePlatform = FakePlatform();
    fakePlatform.present = run.present;
    fakePlatform.failing = run.failing;
    fakePlatform.replies = run.replies;
    fakePlatform.deferAnswers = run.deferAnswers;
    TaskSchedulerActivityHandler(nullptr);
    EXPECT_EQ(fakePlatform.journal, "log running grellon\n" + run.journal);
    TearDown();
  }
}

// Whatever fails, alone or with any other call: nothing leaks, nothing is released twice (the
// platform sees to that), and the run ends.
TEST_F(ActivityHandlerTest, EndsEveryRunWhateverFails) {
  for (const std::deque<bool> &deferAnswers : {std::deque<bool>{}, {false, true, true}, {true}}) {
    size_t calls = 1;
    for (size_t first = 0; first <= calls; ++first) {
      for (size_t second = first; second <= calls; ++second) {
        fakePlatform = FakePlatform();
        fakePlatform.present = {kFirstClass, kThirdClass};
        fakePlatform.replies = {3, 2, 1, 0};
        fakePlatform.deferAnswers = deferAnswers;
        fakePlatform.failing = {"#" + std::to_string(first), "#" + std::to_string(second)};
        TaskSchedulerActivityHandler(nullptr);
        calls = std::max(calls, fakePlatform.calls);
        const bool stopped = fakePlatform.journal.ends_with(kStop);
        const bool deferred = fakePlatform.journal.ends_with(
            "log deferring grellon daemon\n\nset state 3\nexit clean\n");
        EXPECT_TRUE(stopped || deferred) << fakePlatform.journal;
        EXPECT_LE(fakePlatform.calls, 20U);
        TearDown();
      }
    }
  }
}

TEST_F(ActivityHandlerTest, ReleasesTheServiceOfARowWithoutTaskScheduler) {
  const SelectorGetter getter = nand_exporters[0].getTaskSchedulerSelectors;
  nand_exporters[0].getTaskSchedulerSelectors = nullptr;
  fakePlatform.present = {kFirstClass};
  TaskSchedulerActivityHandler(nullptr);
  nand_exporters[0].getTaskSchedulerSelectors = getter;
  EXPECT_EQ(fakePlatform.journal,
            "log running grellon\nmatch VeltoQRN3NVMeController\nlook up = 1\nrelease 1\n" + kStop);
}

TEST_F(ActivityHandlerTest, DoesNothingOutsideTheRunState) {
  fakePlatform.present = {kFirstClass};
  for (const int state : {0, 1, 3, 5}) {
    fakePlatform.activityState = state;
    TaskSchedulerActivityHandler(nullptr);
  }
  EXPECT_EQ(fakePlatform.journal, "");
}

TEST_F(ActivityHandlerTest, RegistersAtCheckIn) {
  RegisterTaskSchedulerActivity();
  EXPECT_EQ(fakePlatform.journal, "register org.morwick.grellon at check-in\n");
}

}  // namespace
