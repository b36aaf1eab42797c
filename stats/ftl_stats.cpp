// The FTL statistics parser.

#include "morwick/ftl_stats.h"

#include <algorithm>
#include <optional>

#include "morwick/error_message.h"
#include "stats/entry_list.h"
#include "stats/record_stream.h"
#include "stats/stats_keys.h"

namespace morwick {
namespace {

constexpr uint32_t kEndId = 0xFFFF;

// What the record of a known key adds to the count: 1 for a scalar, whether it could be added or
// not; of an array as many elements as both the key and the record have. Nothing when those could
// not all be added.
std::optional<uint32_t> AddRecord(GenericParserCxt *ctx, const KeyRow &row, const Record &record) {
  if (row.elementCount == 1) {
    if (AppendEntry(ctx, EntryName(row.name), LoadLittleEndian64(record.payload)) == nullptr) {
      SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u) cannot add 1 element to context",
                         row.name.data(), row.id);
    }
    return 1;
  }
  if (record.length != row.elementCount) {
    SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u): (#%u) cfg elements != (%d) buffer elements",
                       row.name.data(), row.id, row.elementCount, static_cast<int>(record.length));
  }
  const uint32_t count = std::min(record.length, row.elementCount);
  if (AppendElements(ctx, {row.name, "_"}, record.payload, kWordSize, count)) return count;
  SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u): Cannot add %u elements to context",
                     row.name.data(), row.id, row.elementCount);
  return std::nullopt;
}

uint32_t ParseFTL(GenericParserCxt *ctx, RecordStream stream) {
  uint32_t count = 0;
  while (stream.wordsLeft() > 0) {
    const Record record = stream.TakeHeader();
    if (record.length == 0) continue;  // whatever its key
    if (record.id == kEndId || record.id > kHighestId || record.length > stream.wordsLeft()) break;
    if (const KeyRow *row = FindStatsKey(record.id)) {
      const std::optional<uint32_t> added = AddRecord(ctx, *row, record);
      if (!added) break;
      count += *added;
    }
    stream.Skip(record.length);
  }
  return count;
}

}  // namespace
}  // namespace morwick

uint32_t KVRFTLParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint32_t size) {
  if (buffer == nullptr) return 0;
  return morwick::ParseFTL(ctx, morwick::RecordStream(buffer, size));
}
