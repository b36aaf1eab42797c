// Rounding and advertised capacities.

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

// Just below a power of two it is advertised, from it on the next; but for one band.
TEST(CapacityTest, AdvertisesTheNextPowerOfTwo) {
  const auto inBand = [](uint64_t megabytes) {
    return megabytes >= 1376256 && megabytes < 1770496;
  };
  for (uint64_t power = 1; power <= uint64_t{1} << 31; power *= 2) {
    for (const uint64_t megabytes : {power, 2 * power - 1}) {
      const uint64_t expected = inBand(megabytes) ? 1536 : 2 * power / 1024;
      EXPECT_EQ(GetUserCapacityInGB(static_cast<uint32_t>(megabytes)), expected) << megabytes;
    }
  }
  for (const uint32_t megabytes : {0U, 1376255U, 1376256U, 1770495U, 1770496U}) {
    EXPECT_EQ(GetUserCapacityInGB(megabytes), megabytes == 0      ? 0U
                                              : inBand(megabytes) ? 1536U
                                                                  : 2048U);
  }
}

}  // namespace
