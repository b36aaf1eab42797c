// Snapshots in the layout that their header describes, through a buffer of any size.

#include <algorithm>
#include <cstddef>
#include <cstring>

#include "morwick/little_endian.h"
#include "morwick/snapshot.h"
#include "stats/bounded_writer.h"
#include "stats/print_format.h"
#include "stats/snapshot_fields.h"
#include "stats/snapshot_legend.h"

static_assert(sizeof(SnapshotHeader) == 36);
static_assert(offsetof(SnapshotHeader, descriptorTableOffset) == 24);
static_assert(sizeof(SnapshotDescriptorTable) == 8);
static_assert(sizeof(SnapshotFieldDescriptor) == 28);
static_assert(offsetof(SnapshotFieldDescriptor, format) == 12);

namespace morwick {
namespace {

// Reads no more of the header's text than the capacity holds.
bool AppendBanner(BoundedWriter &writer, uint32_t formatVersion, const char *text,
                  uint64_t capacity) {
  if (formatVersion < kSnapshotFirstTextVersion) return writer.Append(kSnapshotLegend);
  return writer.Append("- KVR Snapshot - \n") && writer.Append({text, strnlen(text, capacity)}) &&
         writer.Append("\n");
}

// The label, then one number of each priority's triple.
bool AppendPriorities(BoundedWriter &writer, const Field &field, const char *label,
                      const uint8_t *values, uint32_t width) {
  if (!PrintText(writer, field.format, label)) return false;
  for (uint32_t k = 0; k < field.priorities; ++k, values += kTripleSize) {
    if (k > 0 && !writer.Append("/")) return false;
    if (!PrintPadded(writer, LoadLittleEndian32(values), width, ' ')) return false;
  }
  return true;
}

// False when the buffer is full. Always inline: a call for every field of every record would make
// the rendering take a twentieth more time.
[[gnu::always_inline]] inline bool AppendField(BoundedWriter &writer, const Field &field,
                                               const uint8_t *record) {
  const uint8_t *value = record + field.offset;
  switch (field.kind) {
    case Field::kNumber: {
      const uint32_t number[] = {LoadLittleEndian32(value)};
      return PrintNumbers(writer, field.format, number);
    }
    case Field::kThousandths: {
      const uint32_t thousandths = LoadLittleEndian32(value);
      const uint32_t numbers[] = {thousandths / 1000, thousandths % 1000 / 10};
      return PrintNumbers(writer, field.format, numbers);
    }
    case Field::kPriorities:
      for (const auto &[letter, offset, width] : kTripleParts) {
        if (!AppendPriorities(writer, field, letter, value + offset, width)) return false;
      }
      return true;
    case Field::kNothing: break;
  }
  return true;
}

// The line of a record. A call parses the first descriptors once for all records: half the time.
class Line {
 public:
  explicit Line(const DescriptorTable &table)
      : table_(table), readyCount_(std::min(table.count(), kMostReady)) {
    for (uint32_t i = 0; i < readyCount_; ++i) ready_[i] = table.Read(i);
  }

  // False when the buffer is full.
  bool Append(BoundedWriter &writer, const uint8_t *record) const {
    for (uint32_t i = 0; i < readyCount_; ++i) {
      if (!AppendField(writer, ready_[i], record)) return false;
    }
    for (uint32_t i = readyCount_; i < table_.count(); ++i) {
      if (!AppendField(writer, table_.Read(i), record)) return false;
    }
    return writer.Append("\n");
  }

 private:
  static constexpr uint32_t kMostReady = 32;  // more than the fixed layout has

  const DescriptorTable &table_;
  uint32_t readyCount_;
  Field ready_[kMostReady];
};

// The length of the text up to the last complete line, and whether no record is left.
struct Rendered {
  uint64_t completed;
  bool done;
};

Rendered Render(const uint8_t *snapshot, uint64_t snapshotSize, const uint8_t *header,
                uint64_t capacity, BoundedWriter &writer, uint32_t *state) {
  const auto number = [=](size_t offset) { return LoadLittleEndian32(header + offset); };
  const uint32_t formatVersion = number(offsetof(SnapshotHeader, formatVersion));
  const uint32_t recordSize = number(offsetof(SnapshotHeader, recordSize));
  const uint32_t recordCount = number(offsetof(SnapshotHeader, recordCount));
  const auto *text = reinterpret_cast<const char *>(header) + sizeof(SnapshotHeader);
  if (*state == 0 && !AppendBanner(writer, formatVersion, text, capacity)) return {0, false};
  // The index of the first record that is not printed: the header's last one, or the first one that
  // does not lie in the snapshot whole.
  uint32_t end = recordCount == 0 ? 0 : recordCount - 1;
  if (recordSize > 0)
    end = static_cast<uint32_t>(std::min<uint64_t>(end, snapshotSize / recordSize));
  // Records too short for any number are empty, whatever the table says.
  if (recordSize < kNumberSize) *state = std::max(*state, end);
  if (*state >= end) return {0, true};

  // Read only now: a header without records to print needs no descriptor table.
  const DescriptorTable table(header);
  // Where no field tells an empty record, all count as empty.
  if (!table.TellsEmptyRecords()) *state = end;
  const auto recordAt = [&](uint32_t index) { return snapshot + uint64_t{recordSize} * index; };
  while (*state < end && table.IsEmpty(recordAt(*state))) ++*state;
  if (*state >= end) return {0, true};

  const Line line(table);
  uint64_t completed = 0;
  while (*state < end) {
    const uint8_t *record = recordAt((*state)++);
    if (table.IsEmpty(record)) continue;
    if (!line.Append(writer, record)) return {completed, false};
    completed = writer.length();
  }
  return {completed, true};
}

}  // namespace
}  // namespace morwick

uint64_t KVRParseSnapshotBufferWithInplaceParser(const void *snapshot, uint64_t snapshotSize,
                                                 char *output, uint64_t *outputSize,
                                                 const void *header, uint32_t *state) {
  if (header == nullptr || output == nullptr || outputSize == nullptr || state == nullptr ||
      *outputSize == 0) {
    return 0;
  }
  morwick::BoundedWriter writer(output, *outputSize);
  const auto [completed, done] = morwick::Render(
      static_cast<const uint8_t *>(snapshot), snapshot == nullptr ? 0 : snapshotSize,
      static_cast<const uint8_t *>(header), *outputSize, writer, state);
  // The text ends after the last complete line.
  writer.EndAt(completed);
  *outputSize = completed + 1;
  return done ? 1 : 0;
}
