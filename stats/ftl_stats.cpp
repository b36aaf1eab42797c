// The FTL statistics parser.

#include "morwick/ftl_stats.h"

#include <algorithm>

#include "morwick/error_message.h"
#include "stats/entry_list.h"
#include "stats/record_stream.h"
#include "stats/stats_keys.h"

using morwick::kHighestKey;
using morwick::kWordSize;
using morwick::Record;
using morwick::StatsKey;

namespace {

constexpr uint32_t kEndKey = 0xFFFF;

void AddScalar(GenericParserCxt *context, const StatsKey &key, const Record &record) {
  const auto value = morwick::LoadLittleEndian<uint64_t>(record.payload);
  if (morwick::AppendEntry(context, morwick::EntryName(key.name), value) != nullptr) return;
  SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u) cannot add 1 element to context",
                     key.name.data(), key.id);
}

// Adds as many elements as both the key and the record have and returns their number, or 0 when not
// all could be added.
uint32_t AddArray(GenericParserCxt *context, const StatsKey &key, const Record &record) {
  if (record.length != key.elements) {
    SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u): (#%u) cfg elements != (%d) buffer elements",
                       key.name.data(), key.id, key.elements, static_cast<int>(record.length));
  }
  const uint32_t count = std::min(record.length, key.elements);
  if (morwick::AppendElements(context, {key.name, "_"}, record.payload, kWordSize, count)) {
    return count;
  }
  SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u): Cannot add %u elements to context",
                     key.name.data(), key.id, key.elements);
  return 0;
}

}  // namespace

uint32_t KVRFTLParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint32_t size) {
  if (buffer == nullptr) return 0;
  uint32_t entries = 0;
  morwick::RecordStream stream(buffer, size);
  while (stream.wordsLeft() > 0) {
    const Record record = stream.TakeHeader();
    if (record.length == 0) continue;  // whatever its key
    if (record.key == kEndKey || record.key > kHighestKey || record.length > stream.wordsLeft()) {
      break;
    }
    const StatsKey *key = morwick::FindStatsKey(record.key);
    if (key != nullptr && key->elements == 1) {
      AddScalar(ctx, *key, record);
      ++entries;
    } else if (key != nullptr) {
      const uint32_t added = AddArray(ctx, *key, record);
      if (added == 0) break;
      entries += added;
    }
    stream.Skip(record.length);
  }
  return entries;
}
