// The FTL and the MSP statistics parsers, which fill generic contexts.

#include "morwick/error_message.h"
#include "morwick/ftl_stats.h"
#include "morwick/msp_stats.h"
#include "stats/entry_list.h"
#include "stats/stream_rules.h"

namespace morwick {
namespace {

// Adds the values of a record. False when memory was refused for an element of an array. A scalar
// is counted even then.
bool AddFTLRecord(GenericParserCxt *ctx, const KnownRecord &record) {
  using Rules = StreamRules<kMorwickFTL>;
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

// Adds the values of a record. False when memory was refused for one of them.
bool AddMSPRecord(GenericParserCxt *ctx, const KnownRecord &record) {
  using Rules = StreamRules<kMorwickMSP>;
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

// Adds the values of each record of a known key, until that fails. Returns their number.
template <MorwickStream kStream, bool (*kAddRecord)(GenericParserCxt *, const KnownRecord &)>
uint32_t AddRecords(GenericParserCxt *ctx, const void *buffer, uint32_t size) {
  uint32_t count = 0;
  ForEachKnownRecord<kStream>(buffer, size, [&](const KnownRecord &record) {
    if (!kAddRecord(ctx, record)) return false;
    count += record.valueCount;
    return true;
  });
  return count;
}

}  // namespace
}  // namespace morwick

uint32_t KVRFTLParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint32_t size) {
  if (buffer == nullptr) return 0;
  return morwick::AddRecords<kMorwickFTL, morwick::AddFTLRecord>(ctx, buffer, size);
}

uint64_t KVRMSPParseBufferToCxt(GenericParserCxt *ctx, const void *buffer, uint64_t size) {
  const auto size32 = static_cast<uint32_t>(size);
  if (buffer == nullptr || size32 == 0) {
    SetAPIErrorMessage("KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
    return 0;
  }
  return morwick::AddRecords<kMorwickMSP, morwick::AddMSPRecord>(ctx, buffer, size32);
}
