// Capacity and rounding helpers.

#include "morwick/capacity.h"

#include <bit>
#include <cmath>
#include <iterator>

namespace {

constexpr uint64_t kPowersOfTen[] = {
    1,
    10,
    100,
    1000,
    10000,
    100000,
    1000000,
    10000000,
    100000000,
    1000000000,
    10000000000,
    100000000000,
    1000000000000,
    10000000000000,
    100000000000000,
    1000000000000000,
    10000000000000000,
    100000000000000000,
    1000000000000000000,
};

}  // namespace

uint64_t roundSig(uint64_t value, uint64_t sig) {
  if (value == 0) return 0;
  const auto digits = static_cast<uint64_t>(std::log10(static_cast<double>(value)) + 1.0);
  if (digits <= sig) return value;
  const uint64_t dropped = digits - sig;
  if (dropped >= std::size(kPowersOfTen)) return 0;
  const uint64_t divisor = kPowersOfTen[dropped];
  uint64_t quotient = value / divisor;
  if (value % divisor >= divisor / 2) ++quotient;
  uint64_t rounded = 0;
  return __builtin_mul_overflow(quotient, divisor, &rounded) ? UINT64_MAX : rounded;
}

uint32_t GetUserCapacityInGB(uint32_t megabytes) {
  if (megabytes >= 1376256 && megabytes < 1770496) return 1536;
  const auto highestBit = std::bit_width(megabytes);  // counted from 1; 0 for 0
  return static_cast<uint32_t>((uint64_t{1} << highestBit) / 1024);
}
