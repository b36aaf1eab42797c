// Records of little-endian 32-bit words, as controllers write them.
#ifndef TOOLS_WORDS_H
#define TOOLS_WORDS_H

#include <endian.h>

#include <cstdint>
#include <cstring>
#include <string_view>

namespace tools {

// Reads a record that is made of such words only; zeros where the bytes are too few.
template <typename Record>
Record ReadWords(std::string_view bytes) {
  uint32_t words[sizeof(Record) / 4] = {};
  bytes.copy(reinterpret_cast<char *>(words), sizeof words);
  for (uint32_t &word : words) word = le32toh(word);
  Record record;
  std::memcpy(&record, words, sizeof record);
  return record;
}

}  // namespace tools

#endif
