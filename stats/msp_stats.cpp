// The MSP statistics parser.

#include "morwick/msp_stats.h"

#include <algorithm>

#include "morwick/error_message.h"
#include "stats/entry_list.h"
#include "stats/msp_keys.h"

using morwick::StatsKey;

namespace {

constexpr uint32_t kHeaderSize = 4;
constexpr uint32_t kElementSize = 4;
constexpr uint32_t kEndKey = 0x2FFF;

// Adds as many whole elements as both the key and the record have. False when they could not be
// added; `added` is their number.
bool AddRecord(GenericParserCxt *context, const StatsKey &key, const uint8_t *payload,
               uint32_t length, uint32_t *added) {
  if (length != key.elements * kElementSize) {
    SetAPIErrorMessage(
        "KVRMSPParseBufferToCxt: %s(%u): cfg %u elements; (%u*4) cfg bytes != (%d) buffer bytes",
        key.name.data(), key.id, key.elements, key.elements, static_cast<int>(length));
  }
  *added = std::min(length / kElementSize, key.elements);
  if (morwick::AppendElements(context, morwick::EntryName(key.name), payload, kElementSize,
                              *added)) {
    return true;
  }
  SetAPIErrorMessage("KVRMSPParseBufferToCxt: %s(%u): Error adding %u elements to context",
                     key.name.data(), key.id, key.elements);
  return false;
}

}  // namespace

uint64_t KVRMSPParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint64_t size) {
  auto left = static_cast<uint32_t>(size);
  if (buffer == nullptr || left == 0) {
    SetAPIErrorMessage("KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
    return 0;
  }
  const auto *position = static_cast<const uint8_t *>(buffer);
  uint32_t elements = 0;
  while (left >= kHeaderSize) {
    const uint32_t id = morwick::LoadLittleEndian<uint16_t>(position);
    const uint32_t length = morwick::LoadLittleEndian<uint16_t>(position + 2);
    position += kHeaderSize;
    left -= kHeaderSize;
    if (length == 0) continue;  // a filler, whatever its key
    if (id == kEndKey || length > left) break;
    // Skip records (0x2FFE) have no row and are stepped over as unknown keys are.
    if (const StatsKey *key = morwick::FindMSPKey(id)) {
      uint32_t added = 0;
      if (!AddRecord(ctx, *key, position, length, &added)) break;
      elements += added;
    }
    position += length;
    left -= length;
  }
  return elements;
}
