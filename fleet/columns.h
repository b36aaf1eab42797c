// The columns of a table of dumps: the selected statistics, and the places of a dump's values.
#ifndef FLEET_COLUMNS_H
#define FLEET_COLUMNS_H

#include <cstdint>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <unordered_set>
#include <vector>

#include "fleet/judge.h"
#include "morwick/records.h"

namespace fleet {

// A name that no statistic has. The text suggests the closest name, unless this one is a pattern.
class UnknownName : public std::invalid_argument {
  using std::invalid_argument::invalid_argument;
};

// Statistics by name. The name of an array, or its label such as "name[0..9]", stands for all its
// elements; the name of an element stands for that element. * ? and [ ] match as in a shell: a
// whole array by its name, or else its elements by theirs. Throws UnknownName.
class Selection {
 public:
  struct Column {
    const MorwickKey *key;
    uint32_t index;  // of the value
    std::string name;
  };

  // Without names it has all values of all keys, in the order of the key table. Each name must be
  // in at least one of the streams.
  Selection(std::span<const MorwickStream> streams, std::span<const std::string> names);

  // In the order of the names, each column once.
  const std::vector<Column> &columns() const { return columns_; }

  // Whether an entry of that name is selected. An array's record with a single value gives one
  // entry without an index in its name; it counts as the first element.
  bool Has(std::string_view entryName) const { return names_.contains(entryName); }

 private:
  struct TextHash : std::hash<std::string_view> {
    using is_transparent = void;
  };

  void Add(MorwickStream stream, const MorwickKey &key, uint32_t index);
  // Adds the values of that name, or those whose names match the pattern. False if there are none.
  bool AddAll(MorwickStream stream, const std::string &name, bool isPattern);

  std::vector<Column> columns_;
  std::unordered_set<std::string, TextHash, std::equal_to<>> names_;
};

// Copies the values of dumps into columns.
class ColumnFiller {
 public:
  // All columns of the selection must be of that stream.
  ColumnFiller(MorwickStream stream, const Selection &selection);

  // Sets the value of each column that the dump has, and sets its `present` to 1. Other columns
  // stay as they are. When a name occurs twice the last value counts.
  Verdict Fill(std::string_view dump, std::span<uint64_t> values, std::span<uint8_t> present) const;

 private:
  static constexpr uint32_t kNoColumn = UINT32_MAX;

  MorwickStream stream_;
  // The values of a key begin in columnOf_ at placeOfKey_[id - lowestId_].
  std::vector<uint32_t> placeOfKey_;  // kNoColumn for a key without columns
  uint32_t lowestId_;
  std::vector<uint32_t> columnOf_;  // the column of each value, or kNoColumn
};

}  // namespace fleet

#endif
