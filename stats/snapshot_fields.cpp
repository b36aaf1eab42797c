// The fields of snapshot records, with unique names.

#include "morwick/snapshot_fields.h"

#include <algorithm>
#include <charconv>
#include <iterator>

#include "stats/snapshot_fields.h"

namespace morwick {
namespace {

// The descriptors of a header, or those of the fixed layout.
class Layout {
 public:
  explicit Layout(const uint8_t *header) {
    if (header != nullptr) table_.emplace(header);
  }

  uint32_t count() const {
    return table_ ? table_->count() : static_cast<uint32_t>(std::size(kFixedFields));
  }
  uint32_t OffsetAt(uint32_t index) const {
    return table_ ? table_->OffsetAt(index) : kFixedFields[index].descriptor.fieldOffset;
  }
  Field Read(uint32_t index) const { return table_ ? table_->Read(index) : FixedFieldAt(index); }

 private:
  std::optional<DescriptorTable> table_;
};

// A text with room for every name.
struct Name {
  char text[kMorwickFieldNameRoom] = {};
  size_t length = 0;

  std::string_view view() const { return {text, length}; }
  void Append(std::string_view more) { length += more.copy(text + length, more.size()); }
  void Append(uint64_t number) {
    length = static_cast<size_t>(std::to_chars(text + length, std::end(text), number).ptr - text);
  }
};

MorwickFieldKind KindOf(const Field &field) {
  const bool isTriple = field.kind == Field::kPriorities;
  const bool hasNumber = isTriple ? field.priorities > 0 : field.format.conversionCount > 0;
  if (!hasNumber || field.kind == Field::kNothing) return kMorwickFieldWithoutNumber;
  if (isTriple) return kMorwickFieldPriorities;
  return field.kind == Field::kNumber ? kMorwickFieldNumber : kMorwickFieldThousandths;
}

size_t NameCount(MorwickFieldKind kind) {
  if (kind == kMorwickFieldWithoutNumber) return 0;
  return kind == kMorwickFieldPriorities ? std::size(kTripleParts) : 1;
}

bool IsBlankOrSign(char c) {
  const auto byte = static_cast<unsigned char>(c);
  const auto letter = byte | 0x20;
  return byte < 0x80 && byte != '_' && (byte < '0' || byte > '9') && (letter < 'a' || letter > 'z');
}

// The text before a number, without blanks and signs at its ends.
Name TextBefore(const Field &field, size_t part) {
  const FormatText before = field.kind == Field::kPriorities
                                ? TripleLabel(field, kTripleParts[part])
                                : field.format.texts[0];
  std::string_view text = before.view();
  while (!text.empty() && IsBlankOrSign(text.front())) text.remove_prefix(1);
  while (!text.empty() && IsBlankOrSign(text.back())) text.remove_suffix(1);
  Name name;
  name.Append(text);
  return name;
}

// The label, without the number that a repeated one gets.
Name PlainLabel(const Field &field, size_t part) {
  Name label = TextBefore(field, part);
  if (label.length > 0) return label;
  label.Append("at_");
  label.Append(field.offset + (field.kind == Field::kPriorities ? kTripleParts[part].offset : 0));
  return label;
}

// The number that a repeated label gets: from 2 on, and above the numbers at the end of the
// layout's own labels. 1 for a label that was not there before.
uint64_t NumberOf(const Layout &layout, uint32_t index, size_t part, std::string_view label) {
  uint64_t before = 0;
  uint64_t largest = 1;
  for (uint32_t i = 0; i < layout.count(); ++i) {
    const Field field = layout.Read(i);
    for (size_t k = 0; k < NameCount(KindOf(field)); ++k) {
      const Name other = PlainLabel(field, k);
      std::string_view rest = other.view();
      if (!rest.starts_with(label)) continue;
      rest.remove_prefix(label.size());
      if (rest.empty() && (i < index || (i == index && k < part))) ++before;
      uint64_t number = 0;
      if (!rest.starts_with('_')) continue;
      const auto [end, error] = std::from_chars(rest.begin() + 1, rest.end(), number);
      if (error == std::errc() && end == rest.end()) largest = std::max(largest, number);
    }
  }
  return before == 0 ? 1 : largest + before;
}

// The column's name when it tells more than the label. Fields of the fixed layout have such names,
// and so has a number after a slash that follows such a field. A repeated label has none.
std::string_view ColumnName(const Layout &layout, uint32_t index) {
  const auto isSecond = [](const Field &field) {
    return field.kind == Field::kNumber && field.format.texts[0].view() == "/";
  };
  const bool second = index > 0 && isSecond(layout.Read(index));
  if (second) --index;
  const Field field = layout.Read(index);
  const Name label = TextBefore(field, 0);
  if (label.length == 0 || NumberOf(layout, index, 0, label.view()) > 1) return "";
  for (size_t i = 0; i + 1 < std::size(kFixedFields); ++i) {
    const Field fixed = FixedFieldAt(i);
    if (fixed.kind != field.kind || TextBefore(fixed, 0).view() != label.view()) continue;
    if (!second) return kFixedFields[i].column;
    return isSecond(FixedFieldAt(i + 1)) ? kFixedFields[i + 1].column : "";
  }
  return "";
}

}  // namespace
}  // namespace morwick

int MorwickSnapshotFieldAt(const void *header, uint32_t index, MorwickSnapshotField *field) {
  using namespace morwick;
  const Layout layout(static_cast<const uint8_t *>(header));
  if (field == nullptr || index >= layout.count()) return 0;
  const Field read = layout.Read(index);
  *field = {};
  field->kind = KindOf(read);
  field->offset = layout.OffsetAt(index);
  if (field->kind == kMorwickFieldPriorities) field->priorities = read.priorities;
  for (size_t part = 0; part < NameCount(field->kind); ++part) {
    Name label = PlainLabel(read, part);
    const uint64_t number = NumberOf(layout, index, part, label.view());
    std::string_view column;
    if (number > 1) {
      label.Append("_");
      label.Append(number);
    } else if (field->kind != kMorwickFieldPriorities) {
      column = ColumnName(layout, index);
    }
    if (column.empty()) column = label.view();
    label.view().copy(field->names[part].label, label.length);
    column.copy(field->names[part].column, column.size());
  }
  return 1;
}
