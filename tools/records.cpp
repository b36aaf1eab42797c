// Walks the records of a dump by the layouts that kvr_stats.h and msp_stats.h draw.

#include "tools/records.h"

#include <algorithm>

#include "morwick/little_endian.h"

namespace tools {
namespace {

// The parsers' own rules, which they do not export; a fuzz target holds the two against each other.
struct Format {
  std::string_view stream;
  uint64_t header;  // in bytes
  uint64_t unit;    // that lengths are counted in, in bytes
  uint32_t endId;   // 0: there is none
  uint32_t highestId;
  bool fillers;  // a record of length 0 is one, whatever its key
};

constexpr Format kFormats[] = {
    {"kvr", 8, 8, 0, 0x30000000, false},
    {"ftl", 8, 8, 0xFFFF, 0x30000000, true},
    {"msp", 4, 1, 0x2FFF, UINT16_MAX, true},
};

std::string Record(uint32_t id) { return "the record there (key " + std::to_string(id) + ") "; }

}  // namespace

StatisticsEnd FindEnd(std::string_view stream, std::string_view dump) {
  const auto *found = std::ranges::find(kFormats, stream, &Format::stream);
  if (found == std::end(kFormats)) return {};
  const Format &format = *found;
  uint64_t offset = 0;
  while (dump.size() - offset >= format.header) {
    const bool wide = format.header == 8;
    const uint32_t id =
        wide ? LoadLittleEndian32(&dump[offset]) : LoadLittleEndian16(&dump[offset]);
    const uint32_t length =
        wide ? LoadLittleEndian32(&dump[offset + 4]) : LoadLittleEndian16(&dump[offset + 2]);
    const uint64_t payload = offset + format.header;
    const uint64_t needed = uint64_t{length} * format.unit;
    const uint64_t left = dump.size() - payload;
    if (length > 0 || !format.fillers) {
      if (id == format.endId && format.endId != 0) {
        return {offset, "", needed < left ? left - needed : 0};
      }
      if (id > format.highestId) return {offset, Record(id) + "has no valid key", 0};
      if (needed > left) {
        return {offset,
                Record(id) + "needs " + std::to_string(needed) + " bytes, and " +
                    std::to_string(left) + " are left",
                0};
      }
    }
    offset = payload + needed;
  }
  const uint64_t rest = dump.size() - offset;
  if (rest == 0) return {offset, "", 0};
  return {offset, "the rest, " + std::to_string(rest) + " bytes, is no whole header", 0};
}

}  // namespace tools
