// Capacity and rounding helpers.

#include "morwick/capacity.h"

#include <bit>
#include <cmath>

uint64_t roundSig(uint64_t value, uint64_t sig) {
  constexpr uint64_t kMostDropped = 18;  // digits
  if (value == 0) return 0;
  const auto digits = static_cast<uint64_t>(std::log10(static_cast<double>(value)) + 1.0);
  if (digits <= sig) return value;
  if (digits - sig > kMostDropped) return 0;
  uint64_t divisor = 1;
  for (uint64_t kept = sig; kept < digits; ++kept) divisor *= 10;
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
