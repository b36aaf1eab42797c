// Checksums of tables that are published letter by letter: an accidental edit does not compile.
#ifndef STATS_CHECKSUM_H
#define STATS_CHECKSUM_H

#include <cstdint>
#include <string_view>

namespace morwick {

// FNV-1a of 32 bits, with its two constants. To continue a checksum, pass it as `sum`.
constexpr uint32_t Checksum(std::string_view text, uint32_t sum = 0x811c9dc5) {
  for (const char c : text) sum = (sum ^ static_cast<uint8_t>(c)) * 0x01000193;
  return sum;
}

// The four bytes of a number, the lowest first.
constexpr uint32_t Checksum(uint32_t number, uint32_t sum) {
  for (int shift = 0; shift < 32; shift += 8) sum = (sum ^ (number >> shift & 0xff)) * 0x01000193;
  return sum;
}

// The compiler shows both numbers when they differ.
template <uint32_t kComputed, uint32_t kWritten>
consteval bool ChecksumIs() {
  static_assert(kComputed == kWritten,
                "published text was edited; if that was meant, write kComputed for kWritten");
  return true;
}

}  // namespace morwick

#endif
