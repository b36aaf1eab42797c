// The KVR statistics parser.

#include "morwick/kvr_stats.h"

#include <cstddef>
#include <string_view>

#include "stats/entry_list.h"
#include "stats/record_stream.h"
#include "stats/stats_keys.h"

namespace morwick {
namespace {

// Keeps the value of a key that has a summary field.
void SetSummaryField(KVRStatsCxt *ctx, int32_t key, const uint8_t *values) {
  const auto value = LoadLittleEndian64(values);
  const auto low = static_cast<uint32_t>(value);
  switch (key) {
    case 4: ctx->hostWrites = value; break;
    case 7: ctx->hostReads = value; break;
    case 12: ctx->IND_pool_free = value; break;
    case 13: ctx->IND_pool_count = value; break;
    case 17: ctx->wearLevMoves = value; break;
    case 18: ctx->nandWrites = value; break;
    case 19: ctx->nandReads = value; break;
    case 20: ctx->bandErases = value; break;
    case 28: ctx->numSleepOps = value; break;
    case 45: ctx->maxHighEnduranceBlockErases = value; break;
    case 48: ctx->numFreeVirtualBlocks = value; break;
    case 49: ctx->bytesPerPage = low; break;
    case 50: ctx->pagesPerVirtualBlock = low; break;
    case 51: ctx->blocksPerVirtualBlock = low; break;
    case 52: ctx->numVirtualBlocks = low; break;
    case 53: ctx->exportVersion = low; break;
    case 56: ctx->utilFormatTime = value; break;
    case 265:
      for (uint64_t &entry : ctx->readCountHisto) {
        entry = LoadLittleEndian64(values);
        values += kWordSize;
      }
      break;
    default: break;
  }
}

// Appends one pair, named by the prefix followed directly by the name. False without memory for it.
bool KVRAddValueToContext(KVRStatsCxt *ctx, std::string_view prefix, std::string_view name,
                          uint64_t value) {
  return AppendEntry(ctx, {prefix, name}, value) != nullptr;
}

// Takes over what a known key carries: its summary field and a pair for each of its values. False
// when memory was refused for a pair; the others are appended all the same.
bool KVRAddFieldsToContext(KVRStatsCxt *ctx, int32_t key, std::string_view name,
                           const uint8_t *values, uint32_t count) {
  SetSummaryField(ctx, key, values);
  if (count == 1) return KVRAddValueToContext(ctx, "", name, LoadLittleEndian64(values));
  return AppendElements(ctx, EntryName(name), values, kWordSize, count);
}

// False at a bad header and when memory is refused; what was read before is in the context.
bool ParseKVR(KVRStatsCxt *ctx, RecordStream stream) {
  while (stream.wordsLeft() > 0) {
    const Record record = stream.TakeHeader();
    if (record.id > kHighestId || record.length > stream.wordsLeft()) {
      ctx->exportVersion = 0;
      return false;
    }
    // How many values there are the key says, not the record's length: they may run on into the
    // records behind it, though never past the buffer.
    const KeyRow *row = FindStatsKey(record.id);
    if (row != nullptr && row->elementCount <= stream.wordsLeft() &&
        !KVRAddFieldsToContext(ctx, static_cast<int32_t>(row->id), row->name, record.payload,
                               row->elementCount)) {
      return false;
    }
    stream.Skip(record.length);
  }
  return true;
}

}  // namespace
}  // namespace morwick

int KVRParseBufferToCxt(KVRStatsCxt *ctx, const void *buffer, uint32_t size) {
  if (ctx == nullptr) return 0;
  ctx->parseMarker = -1;
  if (buffer == nullptr || size < morwick::kWordSize) return 0;
  return morwick::ParseKVR(ctx, morwick::RecordStream(buffer, size)) ? 1 : 0;
}

void KVRReleaseContext(KVRStatsCxt *ctx) {
  if (ctx == nullptr) return;
  morwick::FreeEntries(ctx);
  *ctx = {};
}

// The offsets that tools in other languages read by, on 64-bit hosts.
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, exportVersion) == 32);
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, hostReads) == 64);
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, IND_pool_free) == 144);
static_assert(sizeof(void *) != 8 || offsetof(KVRStatsCxt, readCountHisto) == 184);
static_assert(sizeof(void *) != 8 || sizeof(KVRStatsCxt) == 240);
