// Checks snapshot headers.

#include "morwick/snapshot_header.h"

#include <cinttypes>
#include <cstddef>
#include <cstdio>
#include <cstring>

#include "morwick/little_endian.h"

namespace {

struct Finding {
  MorwickHeaderFault fault = kMorwickHeaderIsWhole;
  const char *field = "";
  uint64_t value = 0;
};

Finding Check(const char *header, uint64_t size) {
  if (header == nullptr || size < sizeof(SnapshotHeader)) return {kMorwickHeaderTooShort};
  const auto number = [=](uint64_t offset) { return LoadLittleEndian32(header + offset); };
  if (number(offsetof(SnapshotHeader, recordSize)) == 0) return {kMorwickHeaderNoRecordSize};
  if (number(offsetof(SnapshotHeader, formatVersion)) >= kSnapshotFirstTextVersion &&
      std::memchr(header + sizeof(SnapshotHeader), '\0', size - sizeof(SnapshotHeader)) ==
          nullptr) {
    return {kMorwickHeaderNoTextEnd};
  }
  const uint64_t table = number(offsetof(SnapshotHeader, descriptorTableOffset));
  const uint64_t descriptors = table + sizeof(SnapshotDescriptorTable);
  if (descriptors > size) return {kMorwickHeaderNoTable, "descriptor table offset", table};
  const uint64_t count = number(table);
  if (descriptors + count * sizeof(SnapshotFieldDescriptor) > size) {
    return {kMorwickHeaderNoDescriptors, "descriptor count", count};
  }
  return {};
}

}  // namespace

MorwickHeaderFault MorwickCheckSnapshotHeader(const void *header, uint64_t size, char *text) {
  const Finding finding = Check(static_cast<const char *>(header), size);
  if (text == nullptr) return finding.fault;
  constexpr size_t kRoom = kMorwickHeaderTextRoom;
  switch (finding.fault) {
    case kMorwickHeaderIsWhole: text[0] = '\0'; break;
    case kMorwickHeaderTooShort:
      std::snprintf(text, kRoom, "a header of %" PRIu64 " bytes is shorter than %zu", size,
                    sizeof(SnapshotHeader));
      break;
    case kMorwickHeaderNoRecordSize: std::snprintf(text, kRoom, "the record size is 0"); break;
    case kMorwickHeaderNoTextEnd:
      std::snprintf(text, kRoom, "the text at offset %zu has no end", sizeof(SnapshotHeader));
      break;
    case kMorwickHeaderNoTable:
    case kMorwickHeaderNoDescriptors:
      std::snprintf(text, kRoom, "%s %" PRIu64 " points outside the header of %" PRIu64 " bytes",
                    finding.field, finding.value, size);
      break;
  }
  return finding.fault;
}
