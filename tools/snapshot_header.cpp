// Checks snapshot headers.

#include "tools/snapshot_header.h"

#include <cstddef>

#include "morwick/snapshot.h"
#include "tools/little_endian.h"

namespace tools {
namespace {

constexpr uint32_t kFirstTextVersion = 6;   // the first one whose banner is the header's text
constexpr uint64_t kDescriptorsOffset = 8;  // in the table, behind the count
constexpr uint32_t kLargestRecord = 1 << 20;

}  // namespace

std::string CheckSnapshotHeader(std::string_view file) {
  const auto wrong = [&](const std::string &field, uint64_t value) {
    return field + " " + std::to_string(value) + " points outside the header of " +
           std::to_string(file.size()) + " bytes";
  };
  if (file.size() < sizeof(SnapshotHeader)) {
    return "a header of " + std::to_string(file.size()) + " bytes is shorter than " +
           std::to_string(sizeof(SnapshotHeader));
  }
  const uint32_t recordSize = Load32(file, offsetof(SnapshotHeader, recordSize));
  if (recordSize == 0 || recordSize > kLargestRecord) {
    return "record size " + std::to_string(recordSize) + " is not between 1 and " +
           std::to_string(kLargestRecord);
  }
  if (Load32(file, offsetof(SnapshotHeader, formatVersion)) >= kFirstTextVersion &&
      file.find('\0', sizeof(SnapshotHeader)) == std::string_view::npos) {
    return "the text at offset " + std::to_string(sizeof(SnapshotHeader)) + " has no end";
  }
  const uint64_t table = Load32(file, offsetof(SnapshotHeader, descriptorTableOffset));
  if (table + kDescriptorsOffset > file.size()) return wrong("descriptor table offset", table);
  const uint32_t count = Load32(file, table);
  if (table + kDescriptorsOffset + uint64_t{count} * sizeof(SnapshotFieldDescriptor) >
      file.size()) {
    return wrong("descriptor count", count);
  }
  return "";
}

}  // namespace tools
