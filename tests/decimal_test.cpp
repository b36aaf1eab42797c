// Digits, against the C library: at every power of ten and at random.

#include "stats/decimal.h"

#include <gtest/gtest.h>

#include <random>
#include <string>

namespace {

std::string Printed(const char *format, int width, uint64_t value) {
  char text[64];
  std::snprintf(text, sizeof text, format, width, static_cast<unsigned long long>(value));
  return text;
}

void Check(uint64_t value) {
  char text[morwick::kDecimalRoom];
  EXPECT_EQ(std::string(text, morwick::WriteDecimal(text, value)), Printed("%*llu", 0, value));
  const auto value32 = static_cast<uint32_t>(value);
  for (uint32_t width = 1; width <= 8; ++width) {
    for (const char pad : {' ', '0'}) {
      char padded[morwick::kPaddedRoom];
      EXPECT_EQ(std::string(padded, morwick::WritePadded(padded, value32, width, pad)),
                Printed(pad == '0' ? "%0*llu" : "%*llu", static_cast<int>(width), value32));
    }
  }
}

TEST(DecimalTest, WritesWhatTheCLibraryWrites) {
  Check(UINT64_MAX);
  for (uint64_t power = 1;; power *= 10) {
    for (const uint64_t value : {power - 1, power, power + 1}) Check(value);
    if (power == 10000000000000000000U) break;
  }
  std::mt19937_64 random(1);
  for (int round = 0; round < 20000; ++round) Check(random() >> random() % 64);
}

}  // namespace
