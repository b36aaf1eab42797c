// The simulated drivers, with the scenario of cases/vanishes.toml: handles are checked, and only
// the right request does work. The simulated scheduler, each time in a process of its own.

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <string>

#include "morwick/platform.h"

namespace {

uint32_t Find() { return GetMatchingService(ServiceMatching("KVRStorage")); }

TEST(SimulatedPlatformTest, DoesOneUnitForTheRightRequestOnly) {
  const uint32_t service = Find();
  uint32_t connection = 0;
  EXPECT_NE(OpenService(service, 1, &connection), 0);
  ASSERT_EQ(OpenService(service, 0, &connection), 0);
  ReleaseObject(service);
  const struct {
    uint32_t method, command, argument;
    size_t size, room;
    bool good;
    uint32_t left;
  } cases[] = {{9, 39, 1025, 24, 4, false, 0}, {8, 38, 1025, 24, 4, false, 0},
               {8, 39, 1024, 24, 4, false, 0}, {8, 39, 1025, 23, 4, false, 0},
               {8, 39, 1025, 24, 3, false, 0}, {8, 39, 1025, 24, 4, true, 2},
               {8, 39, 1025, 24, 8, true, 1},  {8, 39, 1025, 24, 4, true, 0},
               {8, 39, 1025, 24, 4, true, 0}};
  for (const auto &[method, command, argument, size, room, good, left] : cases) {
    const uint32_t request[6] = {command, argument};
    uint32_t reply = 0;
    size_t replySize = room;
    EXPECT_EQ(CallStructMethod(connection, method, request, size, &reply, &replySize) == 0, good);
    EXPECT_EQ(reply, left);
    EXPECT_EQ(replySize, good ? 4U : 0U);
  }
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_EQ(Find(), 0U) << "the second look-up finds it gone";
}

TEST(SimulatedPlatformTest, RefusesAndReportsBadHandles) {
  const uint32_t service = Find();
  uint32_t connection = 0;
  OpenService(service, 0, &connection);
  ASSERT_NE(connection, 0U);
  testing::internal::CaptureStderr();
  EXPECT_NE(CloseService(service), 0);
  EXPECT_NE(ReleaseObject(connection + 1), 0);
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_NE(CloseService(connection), 0);
  EXPECT_EQ(ReleaseObject(service), 0);
  EXPECT_NE(OpenService(service, 0, &connection), 0);
  EXPECT_NE(CloseService(0), 0);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "connection " + std::to_string(service) + " is of another kind\n" + "service " +
                std::to_string(service + 2) + " is unknown\n" + "connection " +
                std::to_string(service + 1) + " is already released\n" + "service " +
                std::to_string(service) + " is already released\n");
}

TEST(SimulatedPlatformTest, ReportsHandlesLeftOpenAtExit) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(std::exit(Find() == 1 ? 0 : 1), testing::ExitedWithCode(0),
              "service 1 of KVRStorage is still open");
}

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

[[noreturn]] void PlaySchedule(const std::string &schedule) {
  const int file = memfd_create("scenario", 0);
  const std::string text = "[schedule]\n" + schedule;
  EXPECT_EQ(write(file, text.data(), text.size()), static_cast<ssize_t>(text.size()));
  setenv("GRELLON_SCENARIO", ("/proc/self/fd/" + std::to_string(file)).c_str(), 1);
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
  setenv("FORGETFUL", "", 1);
  EXPECT_EXIT(PlaySchedule("first_run_after = 0"), testing::ExitedWithCode(0),
              checkIn + "state 2 nnnn, the run did not end its transaction\n$");
  unsetenv("FORGETFUL");
}

TEST(SimulatedSchedulerDeathTest, WaitsFractionsOfSeconds) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  for (const char *delay : {"first_run_after", "interval", "resume_after"}) {
    std::string schedule = "runs = 2\ndefer_at_check = [1]\n";
    for (const char *each : {"first_run_after", "interval", "resume_after"}) {
      schedule += std::string(each) + (each == delay ? " = 0.25\n" : " = 0\n");
    }
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EXIT(PlaySchedule(schedule), testing::ExitedWithCode(0), "");
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(250)) << delay;
  }
}

}  // namespace
