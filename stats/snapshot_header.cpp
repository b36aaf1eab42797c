// Checks snapshot headers.

#include "morwick/snapshot_header.h"

#include <cinttypes>
#include <cstdarg>
#include <cstddef>
#include <cstdio>
#include <cstring>

#include "morwick/little_endian.h"

namespace {

// Writes the fault in words, unless `text` is null. Returns the fault.
[[gnu::format(printf, 3, 4)]] MorwickHeaderFault Explain(MorwickHeaderFault fault, char *text,
                                                         const char *format, ...) {
  va_list arguments;
  va_start(arguments, format);
  if (text != nullptr) std::vsnprintf(text, kMorwickHeaderTextRoom, format, arguments);
  va_end(arguments);
  return fault;
}

MorwickHeaderFault Check(const char *header, uint64_t size, char *text) {
  if (header == nullptr || size < sizeof(SnapshotHeader)) {
    return Explain(kMorwickHeaderTooShort, text,
                   "a header of %" PRIu64 " bytes is shorter than %zu", size,
                   sizeof(SnapshotHeader));
  }
  const auto number = [=](uint64_t offset) { return LoadLittleEndian32(header + offset); };
  if (number(offsetof(SnapshotHeader, recordSize)) == 0) {
    return Explain(kMorwickHeaderNoRecordSize, text, "the record size is 0");
  }
  if (number(offsetof(SnapshotHeader, formatVersion)) >= kSnapshotFirstTextVersion &&
      std::memchr(header + sizeof(SnapshotHeader), '\0', size - sizeof(SnapshotHeader)) ==
          nullptr) {
    return Explain(kMorwickHeaderNoTextEnd, text, "the text at offset %zu has no end",
                   sizeof(SnapshotHeader));
  }
  const uint64_t table = number(offsetof(SnapshotHeader, descriptorTableOffset));
  const uint64_t descriptors = table + sizeof(SnapshotDescriptorTable);
  constexpr char kOutside[] = "%s %" PRIu64 " points outside the header of %" PRIu64 " bytes";
  if (descriptors > size) {
    return Explain(kMorwickHeaderNoTable, text, kOutside, "descriptor table offset", table, size);
  }
  const uint64_t count = number(table);
  if (descriptors + count * sizeof(SnapshotFieldDescriptor) > size) {
    return Explain(kMorwickHeaderNoDescriptors, text, kOutside, "descriptor count", count, size);
  }
  return kMorwickHeaderIsWhole;
}

}  // namespace

MorwickHeaderFault MorwickCheckSnapshotHeader(const void *header, uint64_t size, char *text) {
  if (text != nullptr) text[0] = '\0';
  return Check(static_cast<const char *>(header), size, text);
}
