// The numbers that controllers write: little-endian, on any alignment, whatever the host.
#ifndef TOOLS_LITTLE_ENDIAN_H
#define TOOLS_LITTLE_ENDIAN_H

#include <endian.h>

#include <cstdint>
#include <cstring>
#include <string_view>

namespace tools {

// The 32-bit number at the offset, which must lie inside.
inline uint32_t Load32(std::string_view bytes, size_t offset) {
  uint32_t number;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return le32toh(number);
}

inline uint16_t Load16(std::string_view bytes, size_t offset) {
  uint16_t number;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return le16toh(number);
}

}  // namespace tools

#endif
