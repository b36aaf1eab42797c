// Key tables: rows in id order, and what is derived from them and checked at compile time.
#ifndef STATS_KEY_TABLE_H
#define STATS_KEY_TABLE_H

#include <algorithm>
#include <array>
#include <cstdint>
#include <functional>
#include <string_view>

#include "stats/checksum.h"

namespace morwick {

struct KeyRow {
  uint32_t id;
  std::string_view name;  // a literal: its data() ends in a NUL
  uint32_t elementCount;  // 1 for a scalar key
};

// The table of the given rows, which must stand in id order; in which place each id has its row is
// worked out at compile time.
template <const auto &kRows>
class KeyTable {
 public:
  // In constant time; null for an id without a row.
  static const KeyRow *Find(uint32_t id) {
    const uint32_t index = id - kFirst;  // wraps to a large number below the first
    if (index >= kPlaceOfId.size() || kPlaceOfId[index] == 0) return nullptr;
    return &kRows[kPlaceOfId[index] - 1U];
  }

  static constexpr auto ArrayCount() {
    return std::ranges::count_if(kRows, [](const KeyRow &row) { return row.elementCount > 1; });
  }

  // Over ids, names and element counts of all rows.
  static constexpr uint32_t RowsChecksum() {
    uint32_t sum = Checksum("");
    for (const KeyRow &row : kRows) {
      sum = Checksum(row.name, Checksum(row.elementCount, Checksum(row.id, sum)));
    }
    return sum;
  }

 private:
  static_assert(std::ranges::adjacent_find(kRows, std::ranges::greater_equal(), &KeyRow::id) ==
                    kRows.end(),
                "the rows of a key table stand in id order, each id once");

  static constexpr uint32_t kFirst = kRows.front().id;

  // For each id from the first to the last the number of its row, counted from 1; 0 without one.
  static constexpr auto kPlaceOfId = [] {
    std::array<uint16_t, kRows.back().id - kFirst + 1> places = {};
    uint16_t place = 0;
    for (const KeyRow &row : kRows) places[row.id - kFirst] = ++place;
    return places;
  }();
};

}  // namespace morwick

#endif
