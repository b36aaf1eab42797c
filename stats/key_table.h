// Key tables: rows in the order of their ids. Look-up tables and checks are made at compile time.
#ifndef STATS_KEY_TABLE_H
#define STATS_KEY_TABLE_H

#include <algorithm>
#include <array>
#include <cstdint>
#include <functional>
#include <string_view>

#include "morwick/records.h"
#include "stats/checksum.h"

namespace morwick {

// A key as the tables list it.
struct KeyRow {
  uint32_t id;
  const char *name;
  uint32_t valueCount;
};

// Rows in the order of their ids, each id once. For each id from the first to the last, `placeOfId`
// has the number of its row, counted from 1, or 0 for an id without a row. The lookup is inline: a
// call would take longer than the rest of the walk to a record.
template <uint32_t kFirstId, size_t kIdCount, size_t kRowCount>
struct KeyTable {
  std::array<MorwickKey, kRowCount> rows;
  std::array<uint16_t, kIdCount> placeOfId;

  // Takes constant time. Null for an id without a row.
  const MorwickKey *Find(uint32_t id) const {
    const uint32_t index = id - kFirstId;  // an id below the first gives a large number
    if (index >= kIdCount || placeOfId[index] == 0) return nullptr;
    return &rows[placeOfId[index] - 1U];
  }

  constexpr auto ArrayCount() const {
    return std::ranges::count_if(rows, [](const MorwickKey &row) { return row.valueCount > 1; });
  }

  // Covers ids, names and value counts of all rows.
  constexpr uint32_t RowsChecksum() const {
    uint32_t sum = Checksum("");
    for (const MorwickKey &row : rows) {
      sum = Checksum(row.name, Checksum(row.valueCount, Checksum(row.id, sum)));
    }
    return sum;
  }

  constexpr bool IsInOrder() const {
    return rows.front().id == kFirstId && rows.back().id == kFirstId + kIdCount - 1 &&
           std::ranges::adjacent_find(rows, std::ranges::greater_equal(), &MorwickKey::id) ==
               rows.end();
  }
};

// Makes a table of the rows; their number must be that of the table.
template <typename Table, size_t kRowCount>
consteval Table MakeKeyTable(const std::array<KeyRow, kRowCount> &rows) {
  static_assert(std::tuple_size_v<decltype(Table::rows)> == kRowCount,
                "write the number of rows into the table's type, below");
  Table table = {};
  for (size_t place = 0; place < kRowCount; ++place) {
    const auto &[id, name, valueCount] = rows[place];
    const auto nameLength = static_cast<uint32_t>(std::string_view(name).size());
    table.rows[place] = {id, name, valueCount, nameLength};
    table.placeOfId[id - rows.front().id] = static_cast<uint16_t>(place + 1);
  }
  return table;
}

// The 64-bit stream (KVR and FTL) and the MSP stream: first id, number of ids, number of rows.
using StatsKeyTable = KeyTable<1, 659, 568>;
using MSPKeyTable = KeyTable<4096, 4119, 95>;
extern const StatsKeyTable kStatsKeys;
extern const MSPKeyTable kMSPKeys;

}  // namespace morwick

#endif
