// Reads and checks snapshot headers.

#include "fleet/snapshot_header.h"

#include <array>
#include <cstddef>

#include "morwick/little_endian.h"
#include "morwick/snapshot_header.h"

namespace fleet {
namespace {

constexpr uint32_t kLargestRecord = 1 << 20;

}  // namespace

std::string CheckSnapshotHeader(std::string_view file) {
  std::array<char, kMorwickHeaderTextRoom> text;
  if (MorwickCheckSnapshotHeader(file.data(), file.size(), text.data()) != kMorwickHeaderIsWhole) {
    return text.data();
  }
  const uint32_t recordSize = LoadSnapshotHeader(file).recordSize;
  if (recordSize <= kLargestRecord) return "";
  return "record size " + std::to_string(recordSize) + " is above " +
         std::to_string(kLargestRecord);
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

}  // namespace fleet
