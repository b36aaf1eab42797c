// Rounding; a session has the advertised capacities.

#include "morwick/capacity.h"

#include <gtest/gtest.h>

#include "tests/case_file.h"

namespace {

TEST(CapacityTest, RoundsToSignificantDigits) {
  ForEachCase("rounding.txt", [](std::istringstream &columns) {
    uint64_t value, digits, rounded;
    EXPECT_TRUE(columns >> value >> digits >> rounded);
    EXPECT_EQ(roundSig(value, digits), rounded);
  });
}

}  // namespace
