// Snapshots in the layout that their header describes, through a buffer of any size.

#include <algorithm>
#include <cstddef>
#include <cstring>

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
  uint32_t kind;
  uint64_t offset;
  uint32_t size;
  std::string_view format;

  explicit Field(const uint8_t *descriptor)
      : kind(LoadLittleEndian<uint16_t>(descriptor)),
        offset(Word(descriptor, offsetof(SnapshotFieldDescriptor, fieldOffset))),
        size(Word(descriptor, offsetof(SnapshotFieldDescriptor, fieldSize))) {
    const auto *text =
        reinterpret_cast<const char *>(descriptor) + offsetof(SnapshotFieldDescriptor, format);
    format = {text, strnlen(text, sizeof SnapshotFieldDescriptor::format)};
  }

  bool FormatHasItsNul() const { return format.size() < sizeof SnapshotFieldDescriptor::format; }
};

// What the header says, for the records that lie in the snapshot whole.
class Layout {
 public:
  Layout(const uint8_t *header, uint64_t snapshotSize)
      : header_(header),
        table_(header + Word(header, offsetof(SnapshotHeader, descriptorTableOffset))),
        recordSize_(Word(header, offsetof(SnapshotHeader, recordSize))) {
    const uint32_t recordCount = Word(header, offsetof(SnapshotHeader, recordCount));
    last_ = recordCount == 0 ? 0 : recordCount - 1;
    if (recordSize_ != 0) {
      last_ = static_cast<uint32_t>(std::min<uint64_t>(last_, snapshotSize / recordSize_));
    }
  }

  uint32_t recordSize() const { return recordSize_; }

  // The index of the record that ends the rendering; it is not printed itself.
  uint32_t last() const { return last_; }

  uint32_t fieldCount() const { return Word(table_, 0); }

  Field field(uint32_t index) const {
    return Field(table_ + kDescriptorsOffset + sizeof(SnapshotFieldDescriptor) * size_t{index});
  }

  // Whether the field that tells an empty record lies in the records at all.
  bool TellsEmptyRecords() const {
    return fieldCount() > 0 && field(0).offset + kWordSize <= recordSize_;
  }

  bool AppendBanner(BoundedWriter &writer, uint64_t capacity) const {
    if (Word(header_, offsetof(SnapshotHeader, formatVersion)) < kFirstTextVersion) {
      return writer.Append(morwick::kSnapshotLegend);
    }
    const auto *text = reinterpret_cast<const char *>(header_) + sizeof(SnapshotHeader);
    return writer.Append("- KVR Snapshot - \n") && writer.Append({text, strnlen(text, capacity)}) &&
           writer.Append("\n");
  }

 private:
  const uint8_t *header_;
  const uint8_t *table_;
  uint32_t recordSize_;
  uint32_t last_;
};

// One value of each priority's triple, after its label.
bool AppendPriorities(BoundedWriter &writer, const Field &field, std::string_view label,
                      const uint8_t *values, uint32_t width) {
  if (!morwick::PrintText(writer, field.format, label)) return false;
  for (uint32_t k = 0; k < field.size / kTripleSize; ++k) {
    if (k > 0 && !writer.Append("/")) return false;
    if (!writer.AppendPadded(Word(values, uint64_t{kTripleSize} * k), width, ' ')) return false;
  }
  return true;
}

// False when the buffer is full. Whatever a descriptor asks for that is not there is not printed.
bool AppendField(BoundedWriter &writer, const Field &field, const uint8_t *record,
                 uint32_t recordSize) {
  const uint64_t fieldSize = field.kind == 3 ? field.size / kTripleSize * kTripleSize : kWordSize;
  if (field.offset + fieldSize > recordSize || !field.FormatHasItsNul()) return true;
  const uint8_t *value = record + field.offset;
  switch (field.kind) {
    case 0:
    case 1: {
      const uint32_t number[] = {Word(value, 0)};
      return !morwick::AsksForNumbersOnly(field.format, 1) ||
             morwick::PrintNumbers(writer, field.format, number);
    }
    case 2: {
      const uint32_t thousandths = Word(value, 0);
      const uint32_t numbers[] = {thousandths / 1000, thousandths % 1000 / 10};
      return !morwick::AsksForNumbersOnly(field.format, 2) ||
             morwick::PrintNumbers(writer, field.format, numbers);
    }
    case 3:
      return !morwick::AsksForOneTextOnly(field.format) ||
             (AppendPriorities(writer, field, "O", value, 4) &&
              AppendPriorities(writer, field, "L", value + kWordSize, 7) &&
              AppendPriorities(writer, field, "M", value + 2 * kWordSize, 5));
    default:
      return true;
  }
}

bool AppendLine(BoundedWriter &writer, const Layout &layout, const uint8_t *record) {
  for (uint32_t i = 0; i < layout.fieldCount(); ++i) {
    if (!AppendField(writer, layout.field(i), record, layout.recordSize())) return false;
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
  const Layout layout(static_cast<const uint8_t *>(header), snapshot == nullptr ? 0 : snapshotSize);
  BoundedWriter writer(output, *outputSize);
  // Ends this call with the text up to the last complete line.
  const auto end = [&](uint64_t completed, uint64_t result) {
    writer.EndAt(completed);
    *outputSize = completed + 1;
    return result;
  };

  if (*state == 0 && !layout.AppendBanner(writer, *outputSize)) return end(0, 0);
  uint64_t completed = 0;
  // Where no field tells an empty record, all are taken as empty: there is nothing to walk for.
  if (!layout.TellsEmptyRecords()) *state = std::max(*state, layout.last());
  while (*state < layout.last()) {
    const uint8_t *record =
        static_cast<const uint8_t *>(snapshot) + uint64_t{layout.recordSize()} * *state;
    ++*state;
    if (Word(record, layout.field(0).offset) == 0) continue;
    if (!AppendLine(writer, layout, record)) return end(completed, 0);
    completed = writer.length();
  }
  return end(completed, 1);
}
