// The MSP statistics parser.

#include "morwick/msp_stats.h"

#include <algorithm>
#include <optional>

#include "morwick/error_message.h"
#include "morwick/little_endian.h"
#include "stats/entry_list.h"
#include "stats/msp_keys.h"

namespace morwick {
namespace {

constexpr uint32_t kHeaderSize = 4;
constexpr uint32_t kElementSize = 4;
constexpr uint32_t kEndId = 0x2FFF;

// Adds as many whole elements as both the key and the record have and returns their number; nothing
// when they could not all be added.
std::optional<uint32_t> AddRecord(GenericParserCxt *ctx, const KeyRow &row, const uint8_t *payload,
                                  uint32_t length) {
  if (length != row.elementCount * kElementSize) {
    SetAPIErrorMessage(
        "KVRMSPParseBufferToCxt: %s(%u): cfg %u elements; (%u*4) cfg bytes != (%d) buffer bytes",
        row.name.data(), row.id, row.elementCount, row.elementCount, static_cast<int>(length));
  }
  const uint32_t count = std::min(length / kElementSize, row.elementCount);
  if (AppendElements(ctx, EntryName(row.name), payload, kElementSize, count)) return count;
  SetAPIErrorMessage("KVRMSPParseBufferToCxt: %s(%u): Error adding %u elements to context",
                     row.name.data(), row.id, row.elementCount);
  return std::nullopt;
}

uint32_t ParseMSP(GenericParserCxt *ctx, const uint8_t *position, uint32_t left) {
  uint32_t count = 0;
  while (left >= kHeaderSize) {
    const uint32_t id = LoadLittleEndian16(position);
    const uint32_t length = LoadLittleEndian16(position + 2);
    position += kHeaderSize;
    left -= kHeaderSize;
    if (length == 0) continue;  // a filler, whatever its key
    if (id == kEndId || length > left) break;
    // Skip records (0x2FFE) have no row and are stepped over as unknown keys are.
    if (const KeyRow *row = FindMSPKey(id)) {
      const std::optional<uint32_t> added = AddRecord(ctx, *row, position, length);
      if (!added) break;
      count += *added;
    }
    position += length;
    left -= length;
  }
  return count;
}

}  // namespace
}  // namespace morwick

uint64_t KVRMSPParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint64_t size) {
  const auto size32 = static_cast<uint32_t>(size);
  if (buffer == nullptr || size32 == 0) {
    SetAPIErrorMessage("KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
    return 0;
  }
  return morwick::ParseMSP(ctx, static_cast<const uint8_t *>(buffer), size32);
}
