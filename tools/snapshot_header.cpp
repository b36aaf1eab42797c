// Checks snapshot headers.

#include "tools/snapshot_header.h"

#include <endian.h>

#include <cstring>

namespace tools {
namespace {

constexpr uint32_t kFirstTextVersion = 6;   // the first one whose banner is the header's text
constexpr uint64_t kDescriptorsOffset = 8;  // in the table, behind the count

}  // namespace

SnapshotHeader ReadSnapshotHeader(std::string_view file) {
  uint32_t words[sizeof(SnapshotHeader) / sizeof(uint32_t)] = {};
  file.copy(reinterpret_cast<char *>(words), sizeof words);
  for (uint32_t &word : words) word = le32toh(word);
  SnapshotHeader header;
  std::memcpy(&header, words, sizeof header);
  return header;
}

std::string CheckSnapshotHeader(std::string_view file) {
  const auto wrong = [&](const std::string &field, uint64_t value) {
    return field + " " + std::to_string(value) + " points outside the header of " +
           std::to_string(file.size()) + " bytes";
  };
  if (file.size() < sizeof(SnapshotHeader)) {
    return "a header of " + std::to_string(file.size()) + " bytes is shorter than " +
           std::to_string(sizeof(SnapshotHeader));
  }
  const SnapshotHeader header = ReadSnapshotHeader(file);
  if (header.recordSize == 0) return "record size 0 is too small";
  if (header.formatVersion >= kFirstTextVersion &&
      file.find('\0', sizeof(SnapshotHeader)) == std::string_view::npos) {
    return "the text at offset " + std::to_string(sizeof(SnapshotHeader)) + " has no end";
  }
  const uint64_t table = header.descriptorTableOffset;
  if (table + kDescriptorsOffset > file.size()) return wrong("descriptor table offset", table);
  uint32_t count = 0;
  std::memcpy(&count, file.data() + table, sizeof count);
  count = le32toh(count);
  if (table + kDescriptorsOffset + uint64_t{count} * sizeof(SnapshotFieldDescriptor) >
      file.size()) {
    return wrong("descriptor count", count);
  }
  return "";
}

}  // namespace tools
