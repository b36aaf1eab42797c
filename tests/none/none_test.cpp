// The platform without controllers keeps the contract: what fails says so and sets its results.

#include <gtest/gtest.h>

#include "morwick/platform.h"

namespace {

TEST(NoPlatformTest, OffersNothing) {
  EXPECT_EQ(GetMatchingService(ServiceMatching("KVRStorage")), 0U);
  uint32_t connection = 7;
  EXPECT_TRUE(OpenService(7, 0, &connection) != 0 && connection == 0);
  char reply[4] = {'#'};
  size_t size = sizeof reply;
  EXPECT_NE(CallStructMethod(7, 8, nullptr, 0, reply, &size), 0);
  EXPECT_TRUE(size == 0 && reply[0] == '#');
  EXPECT_TRUE(CloseService(7) != 0 && ReleaseObject(7) != 0);
  EXPECT_FALSE(SetActivityState(nullptr, 1) || ActivityShouldDefer(nullptr));
  testing::internal::CaptureStderr();
  for (const char *text : {"100%\n", "", "line"}) SystemLog("%s", text);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "grellon: 100%\ngrellon: \ngrellon: line\n");
}

}  // namespace
