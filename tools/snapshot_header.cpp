// Reads and checks snapshot headers.

#include "tools/snapshot_header.h"

#include <cstddef>

#include "morwick/little_endian.h"

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
  const SnapshotHeader header = LoadSnapshotHeader(file);
  if (header.recordSize == 0 || header.recordSize > kLargestRecord) {
    return "record size " + std::to_string(header.recordSize) + " is not between 1 and " +
           std::to_string(kLargestRecord);
  }
  if (header.formatVersion >= kSnapshotFirstTextVersion &&
      file.find('\0', sizeof(SnapshotHeader)) == std::string_view::npos) {
    return "the text at offset " + std::to_string(sizeof(SnapshotHeader)) + " has no end";
  }
  const uint64_t table = header.descriptorTableOffset;
  const uint64_t descriptors = table + sizeof(SnapshotDescriptorTable);
  if (descriptors > file.size()) return wrong("descriptor table offset", table);
  const uint32_t count = LoadLittleEndian32(&file[table]);
  const uint64_t end = descriptors + uint64_t{count} * sizeof(SnapshotFieldDescriptor);
  return end > file.size() ? wrong("descriptor count", count) : "";
}

SnapshotHeader LoadSnapshotHeader(std::string_view file) {
  const auto number = [&](size_t offset) { return LoadLittleEndian32(&file[offset]); };
  SnapshotHeader header = {};
  header.formatVersion = number(offsetof(SnapshotHeader, formatVersion));
  header.recordSize = number(offsetof(SnapshotHeader, recordSize));
  header.recordCount = number(offsetof(SnapshotHeader, recordCount));
  header.descriptorTableOffset = number(offsetof(SnapshotHeader, descriptorTableOffset));
  return header;
}

}  // namespace tools
