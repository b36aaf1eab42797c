// Reads and checks snapshot headers.

#include "fleet/snapshot_header.h"

#include <array>
#include <cstddef>

#include "morwick/little_endian.h"
#include "morwick/snapshot_fields.h"
#include "morwick/snapshot_header.h"

namespace fleet {
namespace {

constexpr uint32_t kLargestRecord = 1 << 20;  // bytes
constexpr uint32_t kMostFields = 1024;  // the name of each is compared with those of all others

}  // namespace

std::string CheckSnapshotHeader(std::string_view file) {
  std::array<char, kMorwickHeaderTextRoom> text;
  if (MorwickCheckSnapshotHeader(file.data(), file.size(), text.data()) != kMorwickHeaderIsWhole) {
    return text.data();
  }
  const uint32_t recordSize = LoadSnapshotHeader(file).recordSize;
  if (recordSize > kLargestRecord) {
    return "record size " + std::to_string(recordSize) + " is above " +
           std::to_string(kLargestRecord);
  }
  MorwickSnapshotField first;
  if (MorwickSnapshotFieldAt(file.data(), 0, &first) == 0) return "describes no field";
  if (uint64_t{first.offset} + sizeof(uint32_t) <= recordSize) return "";
  return "the first field, which tells empty records, has offset " + std::to_string(first.offset) +
         ", outside the record of " + std::to_string(recordSize) + " bytes";
}

std::string CheckFieldCount(const char *header) {
  MorwickSnapshotField field;
  if (MorwickSnapshotFieldAt(header, kMostFields, &field) == 0) return "";
  return "describes more than " + std::to_string(kMostFields) + " fields";
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
