// The simulated scheduler, and which of its calls end a process.

#include <chrono>
#include <cstdio>

#include "tests/simulated/platform.h"
#include "tests/unit_test.h"

namespace {

bool endsTransactions = true;

// What the scheduler does with an activity, call by call: the state it is in, the answers to four
// questions, and which states it may be set to.
void Journal(Activity *activity) {
  const int state = GetActivityState(activity);
  std::string seen = "state " + std::to_string(state) + " ";
  for (int question = 0; question < 4; ++question)
    seen += ActivityShouldDefer(activity) ? 'y' : 'n';
  const bool yield = seen.ends_with('y');  // once true, the answer stays true
  if (SetActivityState(activity, kActivityStateRun)) seen += " set to run";
  if (yield || state != kActivityStateRun) {
    seen += SetActivityState(activity, kActivityStateDefer) ? " deferred" : " not deferred";
  }
  std::fputs((seen + ", ").c_str(), stderr);
  if (endsTransactions) ExitTransactionClean();
}

// A scenario that cannot be read leaves a tool without controllers, and the daemon does not start.
TEST(SimulatedSchedulerDeathTest, EndsForABadScenarioOnlyWhereItMay) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  setenv("GRELLON_SCENARIO", "/no/such", 1);
  const auto find = [] { return Find() + Find("VeltoQRN3NVMeController"); };
  const std::string complaint = "^platform_tests: /no/such: No such file or directory\n$";
  EXPECT_EXIT(std::exit(static_cast<int>(find())), kEndsWell, complaint);
  void (*const calls[])() = {[] { SystemLog("%s", "never"); },
                             [] { RegisterActivity("never", kActivityCheckIn, Journal); },
                             [] { RunMainQueue(); }};
  for (const auto call : calls) {
    EXPECT_EXIT((call(), std::exit(0)), testing::ExitedWithCode(2), complaint);
    EXPECT_EXIT((find(), call()), testing::ExitedWithCode(2), complaint);
  }
}

[[noreturn]] void PlaySchedule(const std::string &schedule) {
  Play("[schedule]\n" + schedule);
  RegisterActivity("test", kActivityCheckIn, Journal);
  RunMainQueue();
}

TEST(SimulatedSchedulerDeathTest, RunsAndResumesOnSchedule) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const std::string checkIn = "^state 0 nnnn not deferred, ";
  ForEachCase("schedules.txt", [&](std::istringstream &columns) {
    const double least = std::stod(TakeColumn(columns));
    const std::string journal = checkIn + TakeColumn(columns) + " ?$";
    std::string schedule = TakeColumn(columns);
    std::ranges::replace(schedule, ';', '\n');
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EXIT(PlaySchedule(schedule), kEndsWell, journal);
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start;
    EXPECT_TRUE(least <= elapsed.count() && elapsed.count() < least + 1);
  });
  // Without an activity.
  EXPECT_EXIT((Play("schedule.first_run_after = 1000"), RunMainQueue()), kEndsWell, "^$");
  EXPECT_EXIT((endsTransactions = false, PlaySchedule("first_run_after = 0")), kEndsWell,
              checkIn + "state 2 nnnn, the run did not end its transaction\n$");
}

}  // namespace
