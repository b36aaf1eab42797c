// A line of the fixed snapshot layout, and the ways to write it. All write the same.
#ifndef STATS_SNAPSHOT_LINES_H
#define STATS_SNAPSHOT_LINES_H

#include <span>

#include "morwick/little_endian.h"
#include "stats/snapshot_columns.h"

namespace morwick {

constexpr size_t kLabelRoom = 4;    // the longest label; every copy has this size
constexpr size_t kNumberRoom = 10;  // digits of the largest number
constexpr size_t kPieceRoom = 64;   // bytes of the largest store, which may go past the line's end
constexpr size_t kLineRoom = kColumnCount * (kLabelRoom + kNumberRoom) + kPieceRoom;

// The number that the column prints.
inline uint32_t ColumnValue(const Column &column, const uint8_t *record) {
  const uint32_t value = LoadLittleEndian32(record + column.offset);
  switch (column.part) {
    case Part::kThousands: return value / 1000;
    case Part::kHundredths: return value % 1000 / 10;
    case Part::kWhole: break;
  }
  return value;
}

// Writes the record's line and returns its end. `line` has room for kLineRoom characters; after
// the line anything may be left there.
using LineWriter = char *(char *line, const uint8_t *record);

LineWriter WriteLine;  // a number at a time, on any processor

struct LineKernel {
  const char *name;
  bool (*runs)();  // on this processor
  LineWriter *write;
};

std::span<const LineKernel> LineKernels();  // the fastest first, WriteLine last
LineWriter *FastestLineWriter();            // of those that run here, chosen by the first call

}  // namespace morwick

#endif
