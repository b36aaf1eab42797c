// Checks snapshot headers.

#include "tools/snapshot_header.h"

#include <cstddef>

#include "morwick/little_endian.h"
#include "morwick/snapshot.h"

namespace tools {
namespace {

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
  const uint32_t recordSize = LoadLittleEndian32(&file[offsetof(SnapshotHeader, recordSize)]);
  if (recordSize == 0 || recordSize > kLargestRecord) {
    return "record size " + std::to_string(recordSize) + " is not between 1 and " +
           std::to_string(kLargestRecord);
  }
  if (LoadLittleEndian32(&file[offsetof(SnapshotHeader, formatVersion)]) >=
          kSnapshotFirstTextVersion &&
      file.find('\0', sizeof(SnapshotHeader)) == std::string_view::npos) {
    return "the text at offset " + std::to_string(sizeof(SnapshotHeader)) + " has no end";
  }
  const uint64_t table = LoadLittleEndian32(&file[offsetof(SnapshotHeader, descriptorTableOffset)]);
  const uint64_t descriptors = table + sizeof(SnapshotDescriptorTable);
  if (descriptors > file.size()) return wrong("descriptor table offset", table);
  const uint32_t count = LoadLittleEndian32(&file[table]);
  const uint64_t end = descriptors + uint64_t{count} * sizeof(SnapshotFieldDescriptor);
  return end > file.size() ? wrong("descriptor count", count) : "";
}

}  // namespace tools
