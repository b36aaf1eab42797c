// Snapshots in the layout that their header describes, through a buffer of any size.

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <iterator>

#include "morwick/snapshot.h"
#include "stats/bounded_writer.h"
#include "stats/byte_order.h"
#include "stats/print_format.h"
#include "stats/snapshot_legend.h"

using morwick::BoundedWriter;
using morwick::LoadLittleEndian;

namespace {

constexpr uint32_t kWordSize = 4;
constexpr uint32_t kTripleSize = 12;
constexpr uint32_t kFirstTextVersion = 6;  // from here on the banner is the header's own text
constexpr size_t kDescriptorsOffset = 8;   // from the start of the table

static_assert(sizeof(SnapshotHeader) == 36);
static_assert(offsetof(SnapshotHeader, descriptorTableOffset) == 24);
static_assert(sizeof(SnapshotFieldDescriptor) == 28);
static_assert(offsetof(SnapshotFieldDescriptor, format) == 12);

// Numbers by the byte offset of their field.
uint32_t Word(const uint8_t *bytes, uint64_t offset) {
  return LoadLittleEndian<uint32_t>(bytes + offset);
}

// One field of the records, as its descriptor gives it.
struct Field {
  enum Kind : uint8_t { kNumber, kThousandths, kPriorities, kNothing };

  Kind kind;
  uint64_t offset;
  uint32_t priorities;  // kPriorities only
  morwick::PrintFormat format;
};

// What its format may ask for.
morwick::Arguments ArgumentsOf(Field::Kind kind) {
  if (kind == Field::kThousandths) return morwick::Arguments::kTwoNumbers;
  if (kind == Field::kPriorities) return morwick::Arguments::kOneText;
  return morwick::Arguments::kOneNumber;
}

// The field of a descriptor. Of kind kNothing when there is nothing to print, or when what it asks
// for is not there.
void ReadField(const uint8_t *descriptor, uint32_t recordSize, Field *field) {
  constexpr Field::Kind kKinds[] = {Field::kNumber, Field::kNumber, Field::kThousandths,
                                    Field::kPriorities};
  const uint32_t kind = LoadLittleEndian<uint16_t>(descriptor);
  field->kind = kind < std::size(kKinds) ? kKinds[kind] : Field::kNothing;
  field->offset = Word(descriptor, offsetof(SnapshotFieldDescriptor, fieldOffset));
  field->priorities = Word(descriptor, offsetof(SnapshotFieldDescriptor, fieldSize)) / kTripleSize;

  const uint64_t size =
      field->kind == Field::kPriorities ? uint64_t{field->priorities} * kTripleSize : kWordSize;
  const auto *text =
      reinterpret_cast<const char *>(descriptor) + offsetof(SnapshotFieldDescriptor, format);
  const std::string_view format(text, strnlen(text, sizeof SnapshotFieldDescriptor::format));
  if (field->offset + size > recordSize ||
      format.size() == sizeof SnapshotFieldDescriptor::format ||
      !morwick::ReadPrintFormat(format, ArgumentsOf(field->kind), &field->format)) {
    field->kind = Field::kNothing;
  }
}

// The index of the record that ends the rendering, the header's last or the first one that does not
// lie in the snapshot whole. It is not printed itself.
uint32_t LastRecord(const uint8_t *header, uint64_t snapshotSize) {
  const uint32_t recordSize = Word(header, offsetof(SnapshotHeader, recordSize));
  const uint32_t recordCount = Word(header, offsetof(SnapshotHeader, recordCount));
  const uint32_t last = recordCount == 0 ? 0 : recordCount - 1;
  if (recordSize == 0) return last;
  return static_cast<uint32_t>(std::min<uint64_t>(last, snapshotSize / recordSize));
}

// Of the header's text no more is looked at than the capacity holds.
bool AppendBanner(BoundedWriter &writer, const uint8_t *header, uint64_t capacity) {
  if (Word(header, offsetof(SnapshotHeader, formatVersion)) < kFirstTextVersion) {
    return writer.Append(morwick::kSnapshotLegend);
  }
  const auto *text = reinterpret_cast<const char *>(header) + sizeof(SnapshotHeader);
  return writer.Append("- KVR Snapshot - \n") && writer.Append({text, strnlen(text, capacity)}) &&
         writer.Append("\n");
}

// The fields of a line, from the header's descriptor table.
class Fields {
 public:
  explicit Fields(const uint8_t *header)
      : table_(header + Word(header, offsetof(SnapshotHeader, descriptorTableOffset))),
        recordSize_(Word(header, offsetof(SnapshotHeader, recordSize))) {
    for (uint32_t i = 0; i < std::min(count(), kReadyFields); ++i) {
      ReadField(Descriptor(i), recordSize_, &readyFields_[i]);
    }
  }

  uint32_t recordSize() const { return recordSize_; }

  uint32_t count() const { return Word(table_, 0); }

  // The field with this index; `scratch` is room for one that is not kept ready.
  const Field &field(uint32_t index, Field *scratch) const {
    if (index < kReadyFields) return readyFields_[index];
    ReadField(Descriptor(index), recordSize_, scratch);
    return *scratch;
  }

  // Whether the field that tells an empty record lies in the records at all.
  bool TellEmptyRecords() const { return count() > 0 && emptyOffset() + kWordSize <= recordSize_; }

  bool AreEmpty(const uint8_t *record) const { return Word(record, emptyOffset()) == 0; }

 private:
  // The fields that are read once a call instead of once a record, which takes half the time.
  static constexpr uint32_t kReadyFields = 32;

  const uint8_t *Descriptor(uint32_t index) const {
    return table_ + kDescriptorsOffset + sizeof(SnapshotFieldDescriptor) * size_t{index};
  }

  // A record is empty when its first described field is 0, whatever the kind of that field.
  uint64_t emptyOffset() const {
    return Word(Descriptor(0), offsetof(SnapshotFieldDescriptor, fieldOffset));
  }

  const uint8_t *table_;
  uint32_t recordSize_;
  Field readyFields_[kReadyFields];
};

// One value of each priority's triple, after its label.
bool AppendPriorities(BoundedWriter &writer, const Field &field, std::string_view label,
                      const uint8_t *values, uint32_t width) {
  if (!morwick::PrintText(writer, field.format, label)) return false;
  for (uint32_t k = 0; k < field.priorities; ++k, values += kTripleSize) {
    if (k > 0 && !writer.Append("/")) return false;
    if (!writer.AppendPadded(Word(values, 0), width, ' ')) return false;
  }
  return true;
}

// False when the buffer is full.
bool AppendField(BoundedWriter &writer, const Field &field, const uint8_t *record) {
  const uint8_t *value = record + field.offset;
  switch (field.kind) {
    case Field::kNumber: {
      const uint32_t number[] = {Word(value, 0)};
      return morwick::PrintNumbers(writer, field.format, number);
    }
    case Field::kThousandths: {
      const uint32_t thousandths = Word(value, 0);
      const uint32_t numbers[] = {thousandths / 1000, thousandths % 1000 / 10};
      return morwick::PrintNumbers(writer, field.format, numbers);
    }
    case Field::kPriorities:
      return AppendPriorities(writer, field, "O", value, 4) &&
             AppendPriorities(writer, field, "L", value + kWordSize, 7) &&
             AppendPriorities(writer, field, "M", value + size_t{2} * kWordSize, 5);
    case Field::kNothing: break;
  }
  return true;
}

bool AppendLine(BoundedWriter &writer, const Fields &fields, const uint8_t *record) {
  Field scratch;
  for (uint32_t i = 0; i < fields.count(); ++i) {
    if (!AppendField(writer, fields.field(i, &scratch), record)) return false;
  }
  return writer.Append("\n");
}

}  // namespace

uint64_t KVRParseSnapshotBufferWithInplaceParser(const void *snapshot, uint64_t snapshotSize,
                                                 char *output, uint64_t *outputSize,
                                                 const void *header, uint32_t *state) {
  if (header == nullptr || output == nullptr || outputSize == nullptr || state == nullptr ||
      *outputSize == 0) {
    return 0;
  }
  const auto *layout = static_cast<const uint8_t *>(header);
  BoundedWriter writer(output, *outputSize);
  // Ends this call with the text up to the last complete line.
  const auto end = [&](uint64_t completed, uint64_t result) {
    writer.EndAt(completed);
    *outputSize = completed + 1;
    return result;
  };

  if (*state == 0 && !AppendBanner(writer, layout, *outputSize)) return end(0, 0);
  const uint32_t last = LastRecord(layout, snapshot == nullptr ? 0 : snapshotSize);
  if (*state >= last) return end(0, 1);

  // Only now: a header without a record to print needs no descriptor table.
  const Fields fields(layout);
  // Where no field tells an empty record, all are taken as empty: there is nothing to walk for.
  if (!fields.TellEmptyRecords()) *state = last;
  uint64_t completed = 0;
  while (*state < last) {
    const uint8_t *record =
        static_cast<const uint8_t *>(snapshot) + uint64_t{fields.recordSize()} * *state;
    ++*state;
    if (fields.AreEmpty(record)) continue;
    if (!AppendLine(writer, fields, record)) return end(completed, 0);
    completed = writer.length();
  }
  return end(completed, 1);
}
