// The summary fields of a KVR context.

#include "stats/summary_fields.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstring>

#include "morwick/little_endian.h"
#include "morwick/summary.h"

namespace morwick {
namespace {

// The width in bytes of one value of a field, which may be an array.
template <typename Field>
constexpr uint32_t kWidth = sizeof(std::remove_all_extents_t<Field>);

#define FIELD(id, member)                                                                \
  {                                                                                      \
#member, id, offsetof(KVRStatsCxt, member), kWidth < decltype(KVRStatsCxt::member)>, \
        sizeof(KVRStatsCxt::member) / kWidth < decltype(KVRStatsCxt::member)>            \
  }

// In the order of KVRStatsCxt.
constexpr MorwickSummaryField kFields[] = {
    FIELD(53, exportVersion),
    FIELD(52, numVirtualBlocks),
    FIELD(51, blocksPerVirtualBlock),
    FIELD(50, pagesPerVirtualBlock),
    FIELD(49, bytesPerPage),
    FIELD(7, hostReads),
    FIELD(4, hostWrites),
    FIELD(48, numFreeVirtualBlocks),
    FIELD(17, wearLevMoves),
    FIELD(19, nandReads),
    FIELD(18, nandWrites),
    FIELD(20, bandErases),
    FIELD(12, IND_pool_free),
    FIELD(13, IND_pool_count),
    FIELD(56, utilFormatTime),
    FIELD(28, numSleepOps),
    FIELD(45, maxHighEnduranceBlockErases),
    FIELD(265, readCountHisto),
};

#undef FIELD

// For each id up to the highest: the number of its field counted from 1, or 0 without a field.
constexpr auto kPlaceOfId = [] {
  std::array<uint8_t, std::ranges::max(kFields, {}, &MorwickSummaryField::id).id + 1> places = {};
  uint8_t place = 0;
  for (const MorwickSummaryField &field : kFields) places[field.id] = ++place;
  return places;
}();

// Fields, padding and the other members must fill the whole context: a forgotten field does not
// compile.
constexpr size_t kPadding = 4;  // before hostReads
constexpr size_t kOthers = offsetof(KVRStatsCxt, exportVersion) + sizeof(KVRStatsCxt::parseMarker) +
                           sizeof(KVRStatsCxt::reserved1) + sizeof(KVRStatsCxt::reserved2) +
                           sizeof(KVRStatsCxt::reserved3) + kPadding;
static_assert(
    sizeof(void *) != 8 ||
        [] {
          size_t size = kOthers;
          for (const MorwickSummaryField &field : kFields)
            size += size_t{field.valueWidth} * field.valueCount;
          return size == sizeof(KVRStatsCxt);
        }(),
    "a member of KVRStatsCxt has no row");
static_assert(std::ranges::is_sorted(kFields, {}, &MorwickSummaryField::offset));

}  // namespace

void SetSummaryField(KVRStatsCxt *ctx, uint32_t id, const uint8_t *values) {
  if (id >= kPlaceOfId.size() || kPlaceOfId[id] == 0) return;
  const MorwickSummaryField &field = kFields[kPlaceOfId[id] - 1];
  char *place = reinterpret_cast<char *>(ctx) + field.offset;
  for (uint32_t i = 0; i < field.valueCount; ++i) {
    const uint64_t value = LoadLittleEndian64(values + sizeof(uint64_t) * i);
    if (field.valueWidth == sizeof value) {
      std::memcpy(place + sizeof value * i, &value, sizeof value);
    } else {
      const auto low = static_cast<uint32_t>(value);
      std::memcpy(place + sizeof low * i, &low, sizeof low);
    }
  }
}

}  // namespace morwick

uint32_t MorwickSummaryFieldCount() { return std::size(morwick::kFields); }

const MorwickSummaryField *MorwickSummaryFieldAt(uint32_t index) {
  return index < std::size(morwick::kFields) ? &morwick::kFields[index] : nullptr;
}

uint64_t MorwickSummaryValue(const KVRStatsCxt *ctx, const MorwickSummaryField *field,
                             uint32_t index) {
  if (ctx == nullptr || field == nullptr || index >= field->valueCount) return 0;
  const char *place = reinterpret_cast<const char *>(ctx) + field->offset;
  if (field->valueWidth == sizeof(uint64_t)) {
    uint64_t value;
    std::memcpy(&value, place + sizeof value * index, sizeof value);
    return value;
  }
  uint32_t value;
  std::memcpy(&value, place + sizeof value * index, sizeof value);
  return value;
}
