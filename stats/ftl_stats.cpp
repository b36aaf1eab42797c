// The FTL statistics parser.

#include "morwick/ftl_stats.h"

#include "morwick/error_message.h"
#include "stats/entry_list.h"
#include "stats/stream_rules.h"

namespace morwick {
namespace {

using Rules = StreamRules<kMorwickFTL>;

// Adds the values of a record. False when memory was refused for an element of an array. A scalar
// is counted even then.
bool AddRecord(GenericParserCxt *ctx, const KnownRecord &record) {
  const MorwickKey &key = record.key;
  if (Rules::LengthDiffers(key, record.length)) {
    SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u): (#%u) cfg elements != (%d) buffer elements",
                       key.name, key.id, key.valueCount,
                       static_cast<int>(record.length / Rules::kValueWidth));
  }
  const EntryName name(NameOf(key), Rules::Separator(key));
  if (AppendElements(ctx, name, record.values, Rules::kValueWidth, record.valueCount)) return true;
  if (key.valueCount == 1) {
    SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u) cannot add 1 element to context", key.name,
                       key.id);
    return true;
  }
  SetAPIErrorMessage("KVRFTLParseBufferToCxt: %s(%u): Cannot add %u elements to context", key.name,
                     key.id, key.valueCount);
  return false;
}

}  // namespace
}  // namespace morwick

uint32_t KVRFTLParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint32_t size) {
  if (buffer == nullptr) return 0;
  uint32_t count = 0;
  morwick::ForEachKnownRecord<kMorwickFTL>(buffer, size, [&](const morwick::KnownRecord &record) {
    if (!morwick::AddRecord(ctx, record)) return false;
    count += record.valueCount;
    return true;
  });
  return count;
}
