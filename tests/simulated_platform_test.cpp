// The simulated drivers: handles are checked, and only the right request does work. The scenario is
// the one of cases/vanishes.toml.

#include <gtest/gtest.h>

#include <cstdlib>

#include "platform/platform.h"

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

TEST(SimulatedPlatformTest, ReportsHandlesLeftOpenAtExit) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(std::exit(Find() == 1 ? 0 : 1), testing::ExitedWithCode(0),
              "service 1 of KVRStorage is still open");
}

}  // namespace
