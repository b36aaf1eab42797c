// Rounding; a session has the advertised capacities.

#include "morwick/capacity.h"

#include <gtest/gtest.h>

#include <sstream>

#include "tests/case_file.h"

namespace {

TEST(CapacityTest, RoundsToSignificantDigits) {
  CaseFile cases("rounding.txt");
  for (std::string line; cases.Next(&line);) {
    uint64_t value, digits, rounded;
    EXPECT_TRUE(std::istringstream(line) >> value >> digits >> rounded) << cases.where();
    EXPECT_EQ(roundSig(value, digits), rounded) << cases.where();
  }
}

}  // namespace
