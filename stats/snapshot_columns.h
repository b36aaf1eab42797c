// The line of the fixed layout, number by number, for code that the compiler makes for each column.
#ifndef STATS_SNAPSHOT_COLUMNS_H
#define STATS_SNAPSHOT_COLUMNS_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <iterator>

#include "stats/snapshot_fields.h"

namespace morwick {

// What a column prints of its number.
enum class Part { kWhole, kThousands, kHundredths };

struct Column {
  char label[5];
  uint16_t offset;
  uint8_t width = 0;
  char pad = ' ';
  Part part = Part::kWhole;
};

// The line, in print order, as the fields' formats say. A label that is too long, or more columns
// than kColumnCount, does not compile.
inline constexpr size_t kColumnCount = 50;
inline constexpr std::array<Column, kColumnCount> kColumns = [] {
  std::array<Column, kColumnCount> columns;
  auto *column = columns.begin();
  const auto add = [&](const FormatText &label, uint64_t offset, uint32_t width, char pad,
                       Part part = Part::kWhole) {
    *column = {{}, static_cast<uint16_t>(offset), static_cast<uint8_t>(width), pad, part};
    label.view().copy(column->label, label.length);
    column->label[label.length] = '\0';
    ++column;
  };
  for (size_t i = 0; i != std::size(kFixedFields); ++i) {
    const Field field = FixedFieldAt(i);
    const auto &[texts, conversions, conversionCount] = field.format;
    if (field.kind == Field::kPriorities) {
      for (const TriplePart &part : kTripleParts) {
        for (uint32_t k = 0; k < field.priorities; ++k) {
          add(k == 0 ? TripleLabel(field, part) : FormatText{"/", 1},
              field.offset + uint64_t{k} * kTripleSize + part.offset, part.width, ' ');
        }
      }
      continue;
    }
    for (size_t k = 0; k < conversionCount; ++k) {
      const Part part = field.kind == Field::kNumber ? Part::kWhole
                        : k == 0                     ? Part::kThousands
                                                     : Part::kHundredths;
      add(texts[k], field.offset, conversions[k].width, conversions[k].pad, part);
    }
  }
  return columns;
}();
static_assert(kColumns.back().width > 0, "kColumnCount is more than the columns");
static_assert(
    [] {
      for (size_t i = 0; i != std::size(kFixedFields); ++i) {
        const Field field = FixedFieldAt(i);
        const auto &[texts, conversions, conversionCount] = field.format;
        for (size_t k = 0; k < conversionCount; ++k) {
          if (!conversions[k].plain) return false;
        }
        if (field.kind != Field::kPriorities && texts[conversionCount].length > 0) return false;
      }
      return true;
    }(),
    "a column has no place for more than plain conversions and the text before them");

}  // namespace morwick

#endif
