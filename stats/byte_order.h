// The one way to read the multi-byte fields that controllers write: little-endian, any alignment.
#ifndef STATS_BYTE_ORDER_H
#define STATS_BYTE_ORDER_H

#include <bit>
#include <concepts>
#include <cstdint>
#include <cstring>

namespace morwick {

template <std::unsigned_integral Integer>
Integer LoadLittleEndian(const uint8_t *bytes) {
  Integer value;
  std::memcpy(&value, bytes, sizeof value);
  if constexpr (std::endian::native == std::endian::big) {
    Integer swapped = 0;
    for (size_t i = 0; i < sizeof value; ++i) {
      swapped = static_cast<Integer>(swapped << 8 | bytes[sizeof value - 1 - i]);
    }
    return swapped;
  }
  return value;
}

// An integer of up to 8 bytes, zero-extended.
inline uint64_t LoadLittleEndian(const uint8_t *bytes, uint32_t width) {
  if (width == 8) return LoadLittleEndian<uint64_t>(bytes);
  if (width == 4) return LoadLittleEndian<uint32_t>(bytes);
  uint8_t padded[8] = {};
  std::memcpy(padded, bytes, width);
  return LoadLittleEndian<uint64_t>(padded);
}

}  // namespace morwick

#endif
