// The simulated scheduler, and which of its calls end a process.

#include <chrono>
#include <cstdio>

#include "tests/simulated/platform.h"

namespace {

// What the scheduler does with an activity, call by call: the state it is in, the answers to four
// questions, and which states it may be set to.
void Journal(Activity *activity) {
  const int state = GetActivityState(activity);
  std::fprintf(stderr, "state %d ", state);
  bool yield = false;
  for (int question = 0; question < 4; ++question) {
    const bool answer = ActivityShouldDefer(activity);
    std::fputc(answer ? 'y' : 'n', stderr);
    yield = yield || answer;
  }
  if (SetActivityState(activity, kActivityStateRun)) std::fputs(" set to run", stderr);
  if (yield || state != kActivityStateRun) {
    std::fputs(SetActivityState(activity, kActivityStateDefer) ? " deferred" : " not deferred",
               stderr);
  }
  std::fputs(", ", stderr);
  if (std::getenv("FORGETFUL") == nullptr) ExitTransactionClean();
}

// A scenario that cannot be read leaves a tool without controllers, and the daemon does not start.
TEST(SimulatedSchedulerDeathTest, EndsForABadScenarioOnlyWhereItMay) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  setenv("GRELLON_SCENARIO", "/no/such", 1);
  const auto find = [] { return Find() + Find("VeltoQRN3NVMeController"); };
  const struct {
    void (*call)();
    int status;
  } cases[] = {{[] {}, 0},
               {[] { SystemLog("%s", "never"); }, 2},
               {[] { RegisterActivity("never", kActivityCheckIn, Journal); }, 2},
               {[] { RunMainQueue(); }, 2}};
  for (const auto &[call, status] : cases) {
    EXPECT_EXIT((call(), std::exit(static_cast<int>(find()))), testing::ExitedWithCode(status),
                "^platform_tests: /no/such: No such file or directory\n$");
    if (status == 0) continue;
    EXPECT_EXIT((find(), call()), testing::ExitedWithCode(status),
                "^platform_tests: /no/such: No such file or directory\n$");
  }
}

[[noreturn]] void PlaySchedule(const std::string &schedule) {
  Play("[schedule]\n" + schedule);
  RegisterActivity("test", kActivityCheckIn, Journal);
  RunMainQueue();
}

// Delays that are swapped would take a thousand seconds.
TEST(SimulatedSchedulerDeathTest, RunsAndResumesOnSchedule) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const std::string checkIn = "^state 0 nnnn not deferred, ";
  const struct {
    const char *schedule, *journal;
  } cases[] = {
      {"runs = 0\nfirst_run_after = 1000", "$"},
      {"runs = 3\nfirst_run_after = 0\ninterval = 0\nresume_after = 0\n"
       "defer_at_check = [3, 0, 4, 1]",
       "state 2 nnyy deferred, state 2 nnnn, state 2 nnny deferred, state 2 yyyy deferred, "
       "state 2 nnnn, state 2 nnnn, $"},
      {"first_run_after = 0\ninterval = 1000\nresume_after = 0\ndefer_at_check = [4]",
       "state 2 nnny deferred, state 2 nnnn, $"},
      {"runs = 2\nfirst_run_after = 0\ninterval = 0\nresume_after = 1000",
       "state 2 nnnn, state 2 nnnn, $"},
  };
  for (const auto &[schedule, journal] : cases) {
    EXPECT_EXIT(PlaySchedule(schedule), testing::ExitedWithCode(0), checkIn + journal) << schedule;
  }
  EXPECT_EXIT((Play("schedule.first_run_after = 1000"), RunMainQueue()), testing::ExitedWithCode(0),
              "^$")
      << "no activity";
  setenv("FORGETFUL", "", 1);
  EXPECT_EXIT(PlaySchedule("first_run_after = 0"), testing::ExitedWithCode(0),
              checkIn + "state 2 nnnn, the run did not end its transaction\n$");
  unsetenv("FORGETFUL");
}

// A second before a run and two before resuming, unless the scenario has others.
TEST(SimulatedSchedulerDeathTest, WaitsAsLongAsTheScenarioSays) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const struct {
    const char *schedule;
    double seconds;
  } cases[] = {
      {"interval = 0\nresume_after = 0", 1},
      {"first_run_after = 0\nruns = 2", 1},
      {"first_run_after = 0\ndefer_at_check = [1]", 2},
      {"first_run_after = 0.25", 0.25},
      {"first_run_after = 0\nruns = 2\ninterval = 0.25", 0.25},
      {"first_run_after = 0\ndefer_at_check = [1]\nresume_after = 0.25", 0.25},
  };
  for (const auto &[schedule, seconds] : cases) {
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EXIT(PlaySchedule(schedule), testing::ExitedWithCode(0), "");
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start;
    EXPECT_GE(elapsed.count(), seconds) << schedule;
    EXPECT_LT(elapsed.count(), seconds + 1) << schedule;
  }
}

}  // namespace
