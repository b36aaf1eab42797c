// The KVR statistics parser.

#include "morwick/kvr_stats.h"

#include <cstddef>

#include "stats/entry_list.h"
#include "stats/stream_rules.h"
#include "stats/summary_fields.h"

namespace morwick {
namespace {

// Sets the summary field of the record's key and appends an entry for each value. False when memory
// was refused for an entry; the others are still appended.
bool TakeRecord(KVRStatsCxt *ctx, const KnownRecord &record) {
  if (record.valueCount == 0) return true;  // its values would exceed the buffer
  SetSummaryField(ctx, record.key.id, record.values);
  return AppendElements(ctx, EntryName(NameOf(record.key)), record.values,
                        StreamRules<kMorwickKVR>::kValueWidth, record.valueCount);
}

}  // namespace
}  // namespace morwick

int KVRParseBufferToCxt(KVRStatsCxt *ctx, const void *buffer, uint32_t size) {
  if (ctx == nullptr) return 0;
  ctx->parseMarker = -1;
  if (buffer == nullptr || size < kWideHeader) return 0;
  const MorwickStep end = morwick::ForEachKnownRecord<kMorwickKVR>(
      buffer, size,
      [=](const morwick::KnownRecord &record) { return morwick::TakeRecord(ctx, record); });
  if (end == kMorwickBadKey || end == kMorwickTooLong) ctx->exportVersion = 0;
  return end == kMorwickEndOfBuffer || end == kMorwickPartOfHeader ? 1 : 0;
}

void KVRReleaseContext(KVRStatsCxt *ctx) {
  if (ctx == nullptr) return;
  morwick::FreeEntries(ctx);
  *ctx = {};
}

// Tools in other languages read these offsets, on 64-bit hosts.
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, exportVersion) == 32);
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, hostReads) == 64);
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, IND_pool_free) == 144);
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, readCountHisto) == 184);
static_assert(sizeof(void *) != 8 || sizeof(KVRStatsCxt) == 240);
