// Unsigned integers to decimal text.
#ifndef STATS_DECIMAL_H
#define STATS_DECIMAL_H

#include <bit>
#include <cstdint>
#include <cstring>

namespace morwick {

// The eight decimal digits of a value below 10^8, one in each byte, the first digit in the lowest
// byte. Multiplications make all digits at once, without a branch for each.
constexpr uint64_t EightDigits(uint32_t value) {
  // Two groups of four digits, then four of two, then eight of one, each in its own lane. 10486 /
  // 2^20 divides numbers below 43,699 by 100, and 103 / 2^10 numbers below 179 by 10. The masks
  // clear the bits that come from the lane above.
  const uint64_t fours = value / 10000 | static_cast<uint64_t>(value % 10000) << 32;
  const uint64_t hundreds = ((fours * 10486) >> 20) & 0x0000007f0000007f;
  const uint64_t twos = hundreds | (fours - hundreds * 100) << 16;
  const uint64_t tens = ((twos * 103) >> 10) & 0x000f000f000f000f;
  return tens | (twos - tens * 10) << 8;
}

constexpr uint64_t kAsciiZeros = 0x3030303030303030;
constexpr uint64_t kZerosToBlanks = 0x1010101010101010;  // '0' and ' ' differ in this bit

// Eight bytes, the lowest first.
inline void StoreText(char *out, uint64_t text) {
  if constexpr (std::endian::native == std::endian::big) text = __builtin_bswap64(text);
  std::memcpy(out, &text, sizeof text);
}

// Writes eight digits with leading zeros.
inline char *WriteEightDigits(char *out, uint32_t value) {
  StoreText(out, EightDigits(value) | kAsciiZeros);
  return out + 8;
}

// Writes a value below 10^8 without leading zeros. It always writes eight bytes at `out`, zeros
// after the last digit: one store costs less than a branch.
inline char *WriteShortDecimal(char *out, uint32_t value) {
  const uint64_t digits = EightDigits(value);
  // The last digit counts even when it is 0.
  const int leadingZeros = std::countr_zero(digits | uint64_t{1} << 56) / 8;
  StoreText(out, (digits | kAsciiZeros) >> leadingZeros * 8);
  return out + 8 - leadingZeros;
}

constexpr size_t kDecimalRoom = 24;  // the most bytes that WriteDecimal writes at `out`

// Writes any value without leading zeros and returns its end; zeros follow.
inline char *WriteDecimal(char *out, uint64_t value) {
  constexpr uint64_t kGroup = 100000000;
  if (value < kGroup) return WriteShortDecimal(out, static_cast<uint32_t>(value));
  const auto low = static_cast<uint32_t>(value % kGroup);
  value /= kGroup;
  if (value < kGroup) {
    out = WriteShortDecimal(out, static_cast<uint32_t>(value));
  } else {
    out = WriteShortDecimal(out, static_cast<uint32_t>(value / kGroup));
    out = WriteEightDigits(out, static_cast<uint32_t>(value % kGroup));
  }
  return WriteEightDigits(out, low);
}

constexpr size_t kPaddedRoom = 16;  // the most bytes that WritePadded writes at `out`

// Writes the value right-aligned in at least `width` (1 to 8) characters and returns its end.
// Length and padding are computed without branches, because columns hold numbers of all lengths.
inline char *WritePadded(char *out, uint32_t value, uint32_t width, char pad) {
  constexpr uint32_t kGroup = 100000000;
  if (value >= kGroup) {  // nine or ten digits, wider than any column
    out = WriteShortDecimal(out, value / kGroup);
    return WriteEightDigits(out, value % kGroup);
  }
  const uint64_t digits = EightDigits(value);
  const int leadingBits = std::countr_zero(digits | uint64_t{1} << 56) & ~7;
  const uint64_t padding = (uint64_t{1} << leadingBits) - 1;  // a mask of the leading zeros
  const uint64_t text = (digits | kAsciiZeros) ^ (pad == ' ' ? padding & kZerosToBlanks : 0);
  // Drops the leading characters that are padding and that the width does not need.
  const int droppedBits = std::countr_zero(digits | uint64_t{1} << (64 - 8 * width)) & ~7;
  StoreText(out, text >> droppedBits);
  return out + 8 - droppedBits / 8;
}

}  // namespace morwick

#endif
