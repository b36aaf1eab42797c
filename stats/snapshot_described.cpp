// Snapshots in the layout that their header describes, through a buffer of any size.

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <iterator>
#include <optional>
#include <span>

#include "morwick/little_endian.h"
#include "morwick/snapshot.h"
#include "stats/bounded_writer.h"
#include "stats/print_format.h"
#include "stats/snapshot_legend.h"

static_assert(sizeof(SnapshotHeader) == 36);
static_assert(offsetof(SnapshotHeader, descriptorTableOffset) == 24);
static_assert(sizeof(SnapshotDescriptorTable) == 8);
static_assert(sizeof(SnapshotFieldDescriptor) == 28);
static_assert(offsetof(SnapshotFieldDescriptor, format) == 12);

namespace morwick {
namespace {

constexpr uint32_t kNumberSize = sizeof(uint32_t);
constexpr uint32_t kTripleSize = sizeof(SnapshotOperations);
static_assert(kFormatRoom == sizeof SnapshotFieldDescriptor::format);

// One field of the records, as its descriptor gives it.
struct Field {
  enum Kind : uint8_t { kNumber, kThousandths, kPriorities, kNothing };

  Kind kind;
  uint64_t offset;
  uint32_t priorities;  // kPriorities only
  PrintFormat format;
};

// What its format may ask for.
Arguments ArgumentsOf(Field::Kind kind) {
  if (kind == Field::kThousandths) return Arguments::kTwoNumbers;
  if (kind == Field::kPriorities) return Arguments::kOneText;
  return Arguments::kOneNumber;
}

// The field of a descriptor. Of kind kNothing when there is nothing to print, or when what it asks
// for is not there.
Field ReadField(const uint8_t *descriptor, uint32_t recordSize) {
  constexpr Field::Kind kKinds[] = {Field::kNumber, Field::kNumber, Field::kThousandths,
                                    Field::kPriorities};
  Field field;
  const uint32_t kind = LoadLittleEndian16(descriptor);
  field.kind = kind < std::size(kKinds) ? kKinds[kind] : Field::kNothing;
  field.offset = LoadLittleEndian32(descriptor + offsetof(SnapshotFieldDescriptor, fieldOffset));
  field.priorities =
      LoadLittleEndian32(descriptor + offsetof(SnapshotFieldDescriptor, fieldSize)) / kTripleSize;
  // Labels alone: nothing is read, wherever the offset points.
  if (field.kind == Field::kPriorities && field.priorities == 0) field.offset = 0;

  const uint64_t size =
      field.kind == Field::kPriorities ? uint64_t{field.priorities} * kTripleSize : kNumberSize;
  const auto *text =
      reinterpret_cast<const char *>(descriptor) + offsetof(SnapshotFieldDescriptor, format);
  const std::string_view format(text, strnlen(text, kFormatRoom));
  std::optional<PrintFormat> read;
  if (field.offset + size <= recordSize && format.size() < kFormatRoom) {
    read = ReadPrintFormat(format, ArgumentsOf(field.kind));
  }
  if (read) {
    field.format = *read;
  } else {
    field.kind = Field::kNothing;
  }
  return field;
}

// The header's own numbers.
struct HeaderNumbers {
  uint32_t formatVersion;
  uint32_t recordSize;
  uint32_t recordCount;
  uint32_t descriptorTableOffset;

  explicit HeaderNumbers(const uint8_t *header)
      : formatVersion(LoadLittleEndian32(header + offsetof(SnapshotHeader, formatVersion))),
        recordSize(LoadLittleEndian32(header + offsetof(SnapshotHeader, recordSize))),
        recordCount(LoadLittleEndian32(header + offsetof(SnapshotHeader, recordCount))),
        descriptorTableOffset(
            LoadLittleEndian32(header + offsetof(SnapshotHeader, descriptorTableOffset))) {}

  // The index of the record that ends the rendering, the header's last or the first one that does
  // not lie in the snapshot whole. It is not printed itself.
  uint32_t LastRecord(uint64_t snapshotSize) const {
    const uint32_t last = recordCount == 0 ? 0 : recordCount - 1;
    if (recordSize == 0) return last;
    return static_cast<uint32_t>(std::min<uint64_t>(last, snapshotSize / recordSize));
  }
};

// Of the header's text no more is looked at than the capacity holds.
bool AppendBanner(BoundedWriter &writer, const HeaderNumbers &numbers, const char *text,
                  uint64_t capacity) {
  if (numbers.formatVersion < kSnapshotFirstTextVersion) return writer.Append(kSnapshotLegend);
  return writer.Append("- KVR Snapshot - \n") && writer.Append({text, strnlen(text, capacity)}) &&
         writer.Append("\n");
}

// The header's descriptor table.
class DescriptorTable {
 public:
  DescriptorTable(const uint8_t *table, uint32_t recordSize)
      : descriptors_(table + sizeof(SnapshotDescriptorTable)),
        count_(LoadLittleEndian32(table)),
        recordSize_(recordSize) {}

  uint32_t count() const { return count_; }
  Field Read(uint32_t index) const { return ReadField(Descriptor(index), recordSize_); }

  // Whether the field that tells an empty record lies in the records at all.
  bool TellsEmptyRecords() const {
    return count_ > 0 && EmptyOffset() + kNumberSize <= recordSize_;
  }

  bool IsEmpty(const uint8_t *record) const {
    return LoadLittleEndian32(record + EmptyOffset()) == 0;
  }

 private:
  const uint8_t *Descriptor(uint32_t index) const {
    return descriptors_ + sizeof(SnapshotFieldDescriptor) * size_t{index};
  }

  // A record is empty when its first described field is 0, whatever the kind of that field.
  uint64_t EmptyOffset() const {
    return LoadLittleEndian32(Descriptor(0) + offsetof(SnapshotFieldDescriptor, fieldOffset));
  }

  const uint8_t *descriptors_;
  uint32_t count_;
  uint32_t recordSize_;
};

// The first fields of a line, which are read once a call instead of once a record: half the time.
class ReadyFields {
 public:
  explicit ReadyFields(const DescriptorTable &table) : count_(std::min(table.count(), kMost)) {
    for (uint32_t i = 0; i < count_; ++i) fields_[i] = table.Read(i);
  }

  std::span<const Field> fields() const { return {fields_, count_}; }

 private:
  static constexpr uint32_t kMost = 32;

  uint32_t count_;
  Field fields_[kMost];
};

// One value of each priority's triple, after its label.
bool AppendPriorities(BoundedWriter &writer, const Field &field, const char *label,
                      const uint8_t *values, uint32_t width) {
  if (!PrintText(writer, field.format, label)) return false;
  for (uint32_t k = 0; k < field.priorities; ++k, values += kTripleSize) {
    if (k > 0 && !writer.Append("/")) return false;
    if (!PrintPadded(writer, LoadLittleEndian32(values), width, ' ')) return false;
  }
  return true;
}

// False when the buffer is full. Called for every field of every record: as a function of its own
// it would take a twentieth more time.
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
      return AppendPriorities(writer, field, "O", value, 4) &&
             AppendPriorities(writer, field, "L",
                              value + offsetof(SnapshotOperations, totalLatency), 7) &&
             AppendPriorities(writer, field, "M", value + offsetof(SnapshotOperations, maxLatency),
                              5);
    case Field::kNothing: break;
  }
  return true;
}

bool AppendLine(BoundedWriter &writer, std::span<const Field> ready, const DescriptorTable &table,
                const uint8_t *record) {
  for (const Field &field : ready) {
    if (!AppendField(writer, field, record)) return false;
  }
  for (auto i = static_cast<uint32_t>(ready.size()); i < table.count(); ++i) {
    if (!AppendField(writer, table.Read(i), record)) return false;
  }
  return writer.Append("\n");
}

// What a call comes to: the length of the lines that were completed, and whether the last record
// has been dealt with.
struct Rendered {
  uint64_t completed;
  bool done;
};

Rendered Render(const uint8_t *snapshot, uint64_t snapshotSize, const uint8_t *header,
                uint64_t capacity, BoundedWriter &writer, uint32_t *state) {
  const HeaderNumbers numbers(header);
  const auto *text = reinterpret_cast<const char *>(header) + sizeof(SnapshotHeader);
  if (*state == 0 && !AppendBanner(writer, numbers, text, capacity)) return {0, false};
  const uint32_t last = numbers.LastRecord(snapshotSize);
  // Records too short for any number are empty, whatever the table says.
  if (numbers.recordSize < kNumberSize) *state = std::max(*state, last);
  if (*state >= last) return {0, true};

  // Only now: where no record is left the header needs no descriptor table.
  const DescriptorTable table(header + numbers.descriptorTableOffset, numbers.recordSize);
  // Where no field tells an empty record, all are taken as empty: there is nothing to walk for.
  if (!table.TellsEmptyRecords()) *state = last;
  const auto recordAt = [&](uint32_t index) {
    return snapshot + uint64_t{numbers.recordSize} * index;
  };
  while (*state < last && table.IsEmpty(recordAt(*state))) ++*state;
  if (*state >= last) return {0, true};

  const ReadyFields ready(table);
  uint64_t completed = 0;
  while (*state < last) {
    const uint8_t *record = recordAt((*state)++);
    if (table.IsEmpty(record)) continue;
    if (!AppendLine(writer, ready.fields(), table, record)) return {completed, false};
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
