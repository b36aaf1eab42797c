// Key tables: rows in id order, and what is derived from them and checked at compile time.
#ifndef STATS_KEY_TABLE_H
#define STATS_KEY_TABLE_H

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "stats/checksum.h"

namespace morwick {

struct StatsKey {
  uint32_t id;
  std::string_view name;  // a literal: its data() ends in a NUL
  uint32_t elements;      // 1 for a scalar key
};

template <size_t kRows>
constexpr bool IdsAscend(const std::array<StatsKey, kRows> &keys) {
  return std::ranges::adjacent_find(keys, [](const StatsKey &key, const StatsKey &next) {
           return key.id >= next.id;
         }) == keys.end();
}

template <size_t kRows>
constexpr ptrdiff_t ArrayKeyCount(const std::array<StatsKey, kRows> &keys) {
  return std::ranges::count_if(keys, [](const StatsKey &key) { return key.elements > 1; });
}

// Over ids, names and elements of all rows.
template <size_t kRows>
constexpr uint32_t TableChecksum(const std::array<StatsKey, kRows> &keys) {
  uint32_t sum = Checksum("");
  for (const StatsKey &key : keys) {
    for (const uint32_t number : {key.id, key.elements}) {
      for (uint32_t shift = 0; shift < 32; shift += 8) {
        const char byte[] = {static_cast<char>(number >> shift)};
        sum = Checksum({byte, 1}, sum);
      }
    }
    sum = Checksum(key.name, sum);
  }
  return sum;
}

// For each id from kFirst to kLast the number of its row, counted from 1; 0 for an id without one.
template <uint32_t kFirst, uint32_t kLast, size_t kRows>
constexpr auto RowsById(const std::array<StatsKey, kRows> &keys) {
  std::array<uint16_t, kLast - kFirst + 1> rows = {};
  for (size_t row = 0; row < kRows; ++row) {
    rows[keys[row].id - kFirst] = static_cast<uint16_t>(row + 1);
  }
  return rows;
}

// In constant time; null for an id without a row.
template <uint32_t kFirst, size_t kRows, size_t kIds>
const StatsKey *FindRow(const std::array<StatsKey, kRows> &keys,
                        const std::array<uint16_t, kIds> &rowOfId, uint32_t id) {
  const uint32_t index = id - kFirst;  // wraps to a large number below kFirst
  if (index >= kIds || rowOfId[index] == 0) return nullptr;
  return &keys[rowOfId[index] - 1U];
}

}  // namespace morwick

#endif
