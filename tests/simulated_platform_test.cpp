// The simulated drivers: handles are checked, and only the right request does work.

#include <gtest/gtest.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <fstream>

#include "platform/platform.h"

namespace {

class SimulatedPlatformTest : public testing::Test {
 protected:
  static void SetUpTestSuite() {
    if (std::getenv("GRELLON_SCENARIO") != nullptr)
      return;  // the child of a death test inherits it
    std::ofstream(file) << "[[controller]]\nclass = 'KVRStorage'\npending = 3\nvanish = [2]\n";
    setenv("GRELLON_SCENARIO", file.c_str(), 1);
  }
  static void TearDownTestSuite() { std::remove(file.c_str()); }

  static inline const std::string file =
      testing::TempDir() + "simulated_platform_" + std::to_string(getpid()) + ".toml";
};

uint32_t Find() { return GetMatchingService(ServiceMatching("KVRStorage")); }

TEST_F(SimulatedPlatformTest, DoesOneUnitForTheRightRequestOnly) {
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
    const std::array<uint32_t, 6> request = {command, argument};
    uint32_t reply = 0;
    size_t replySize = room;
    EXPECT_EQ(CallStructMethod(connection, method, &request, size, &reply, &replySize) == 0, good);
    EXPECT_EQ(reply, left);
    EXPECT_EQ(replySize, good ? 4U : 0U);
  }
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_EQ(Find(), 0U) << "the second look-up finds it gone";
}

TEST_F(SimulatedPlatformTest, RefusesAndReportsBadHandles) {
  const uint32_t service = Find();
  uint32_t connection = 0;
  OpenService(service, 0, &connection);
  ASSERT_NE(connection, 0U);
  testing::internal::CaptureStderr();
  EXPECT_NE(CloseService(service), 0);
  EXPECT_NE(ReleaseObject(999), 0);
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_NE(CloseService(connection), 0);
  EXPECT_EQ(ReleaseObject(service), 0);
  EXPECT_NE(OpenService(service, 0, &connection), 0);
  EXPECT_NE(CloseService(0), 0);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "connection " + std::to_string(service) + " is of another kind\n" +
                "service 999 is unknown\n" + "connection " + std::to_string(service + 1) +
                " is already released\n" + "service " + std::to_string(service) +
                " is already released\n");
}

TEST_F(SimulatedPlatformTest, ReportsHandlesLeftOpenAtExit) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(
      {
        Find();
        std::exit(0);
      },
      testing::ExitedWithCode(0), "service 1 of KVRStorage is still open");
}

}  // namespace
