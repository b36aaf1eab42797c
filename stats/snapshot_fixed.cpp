// Snapshots of the fixed record layout as text.

#include <cstddef>
#include <string_view>
#include <utility>

#include "morwick/snapshot.h"
#include "stats/bounded_writer.h"
#include "stats/decimal.h"
#include "stats/snapshot_legend.h"
#include "stats/snapshot_lines.h"

namespace morwick {
namespace {

static_assert(sizeof(SnapshotRecord) == 252);
static_assert(offsetof(SnapshotRecord, reads) == 56);
static_assert(offsetof(SnapshotRecord, erasedBands) == 104);
static_assert(offsetof(SnapshotRecord, wearLevelBands) == 132);
static_assert(offsetof(SnapshotRecord, hysteresisTime) == 156);
static_assert(offsetof(SnapshotRecord, freeNodes) == 180);
static_assert(offsetof(SnapshotRecord, commandTagsMax) == 216);

// A label such as " HW=" has the line "HW  - Host Writes" in the legend.
static_assert(
    [] {
      for (const Column &column : kColumns) {
        std::string_view label = column.label;
        if (!label.ends_with('=')) continue;  // one more number of the same label
        label = label.substr(label.find_first_not_of(' '));
        label.remove_suffix(1);
        const std::string_view rest = std::string_view("   - ").substr(label.size() - 1);
        size_t at = kSnapshotLegend.find(label);
        while (!kSnapshotLegend.substr(at + label.size()).starts_with(rest)) {
          at = kSnapshotLegend.find(label, at + 1);
          if (at == std::string_view::npos) return false;
        }
      }
      return true;
    }(),
    "a column has no line in the legend");

// The column is a constant here, and so are its label, width and padding: this takes a quarter less
// time than a loop over the columns.
template <Column kColumn>
char *WriteColumn(char *out, const uint8_t *record) {
  std::memcpy(out, kColumn.label, kLabelRoom);
  out += std::string_view(kColumn.label).size();
  return WritePadded(out, ColumnValue(kColumn, record), kColumn.width, kColumn.pad);
}

template <size_t... kIndices>
char *WriteColumns(char *out, const uint8_t *record, std::index_sequence<kIndices...>) {
  ((out = WriteColumn<kColumns[kIndices]>(out, record)), ...);
  return out;
}

// False when the text does not fit.
bool RenderFixed(BoundedWriter &writer, const uint8_t *record, uint32_t recordCount) {
  if (!writer.Append(kSnapshotLegend)) return false;
  LineWriter *const write = FastestLineWriter();
  for (uint32_t i = 0; i < recordCount; ++i, record += sizeof(SnapshotRecord)) {
    if (!writer.AppendWritten<kLineRoom>([=](char *line) { return write(line, record); })) {
      return false;
    }
  }
  return writer.Append("\n");
}

}  // namespace

char *WriteLine(char *line, const uint8_t *record) {
  char *end = WriteColumns(line, record, std::make_index_sequence<kColumnCount>());
  *end++ = '\n';
  return end;
}

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
