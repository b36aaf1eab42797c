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
  const struct {
    uint32_t megabytes, gigabytes;
  } cases[] = {
      {0, 0},
      {1, 0},
      {511, 0},
      {512, 1},
      {1023, 1},
      {1024, 2},
      {30000, 32},
      {488000, 512},
      {976000, 1024},
      {1048575, 1024},
      {1048576, 2048},
      {1376255, 2048},
      {1376256, 1536},
      {1770495, 1536},
      {1770496, 2048},
      {2097151, 2048},
      {2097152, 4096},
      {1U << 30, 2097152},
      {0x7fffffff, 2097152},
      {0x80000000, 4194304},
      {0xffffffff, 4194304},
  };
  for (const auto &[megabytes, gigabytes] : cases) {
    EXPECT_EQ(GetUserCapacityInGB(megabytes), gigabytes) << megabytes;
  }
}

}  // namespace
