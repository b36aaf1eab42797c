// The MSP statistics parser.

#include "morwick/msp_stats.h"

#include "morwick/error_message.h"
#include "stats/entry_list.h"
#include "stats/stream_rules.h"

namespace morwick {
namespace {

using Rules = StreamRules<kMorwickMSP>;

// Adds the values of a record. False when memory was refused for one of them.
bool AddRecord(GenericParserCxt *ctx, const KnownRecord &record) {
  const MorwickKey &key = record.key;
  if (Rules::LengthDiffers(key, record.length)) {
    SetAPIErrorMessage(
        "KVRMSPParseBufferToCxt: %s(%u): cfg %u elements; (%u*4) cfg bytes != (%d) buffer bytes",
        key.name, key.id, key.valueCount, key.valueCount, static_cast<int>(record.length));
  }
  const EntryName name(NameOf(key));
  if (AppendElements(ctx, name, record.values, Rules::kValueWidth, record.valueCount)) return true;
  SetAPIErrorMessage("KVRMSPParseBufferToCxt: %s(%u): Error adding %u elements to context",
                     key.name, key.id, key.valueCount);
  return false;
}

}  // namespace
}  // namespace morwick

uint64_t KVRMSPParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint64_t size) {
  const auto size32 = static_cast<uint32_t>(size);
  if (buffer == nullptr || size32 == 0) {
    SetAPIErrorMessage("KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
    return 0;
  }
  uint32_t count = 0;
  morwick::ForEachKnownRecord<kMorwickMSP>(buffer, size32, [&](const morwick::KnownRecord &record) {
    if (!morwick::AddRecord(ctx, record)) return false;
    count += record.valueCount;
    return true;
  });
  return count;
}
