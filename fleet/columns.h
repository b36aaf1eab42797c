// The columns of a table of dumps: which statistics are asked for, and where a dump's values go.
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

// A name that no statistic of the stream has; says so, and suggests another one.
class UnknownName : public std::invalid_argument {
  using std::invalid_argument::invalid_argument;
};

// Statistics by name. The name of an array stands for all its elements, that of an element for it
// alone; * ? and [ ] in a name stand for what they stand for in a shell, and take an array whose
// name matches, or else those elements that do. Throws UnknownName.
class Selection {
 public:
  struct Column {
    const MorwickKey *key;
    uint32_t index;  // of the value
    std::string name;
  };

  // Without names: all values of all keys, in the order of the key table. Of several streams one
  // must have each name.
  Selection(std::span<const MorwickStream> streams, std::span<const std::string> names);

  // In the order in which they were asked for, each once.
  const std::vector<Column> &columns() const { return columns_; }

  // Whether an entry of that name is asked for. A record that is too short gives an entry that is
  // named like the array alone; it belongs to those who ask for its first element.
  bool Has(std::string_view entryName) const { return names_.contains(entryName); }

 private:
  struct TextHash : std::hash<std::string_view> {
    using is_transparent = void;
  };

  void Add(MorwickStream stream, const MorwickKey &key, uint32_t index);
  bool AddMatches(MorwickStream stream, const std::string &pattern);
  bool AddNamed(MorwickStream stream, const std::string &name);

  std::vector<Column> columns_;
  std::unordered_set<std::string, TextHash, std::equal_to<>> names_;
};

// Takes the values of dumps apart into columns.
class ColumnFiller {
 public:
  ColumnFiller(MorwickStream stream, const Selection &selection);

  // Sets the value of each column that the dump has, and `present` to 1 for it. What a dump lacks
  // stays as it was. Where a name occurs twice the last value counts.
  Verdict Fill(std::string_view dump, std::span<uint64_t> values, std::span<uint8_t> present) const;

 private:
  static constexpr uint32_t kNoColumn = UINT32_MAX;

  const uint32_t *ColumnsOf(const MorwickKey &key) const;

  MorwickStream stream_;
  std::vector<uint32_t> firstOfId_;  // place in columns_, by key id less the first
  uint32_t firstId_;
  std::vector<uint32_t> columns_;  // for each value of a key that has a column
};

}  // namespace fleet

#endif
