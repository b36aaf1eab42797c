// The columns of a table of dumps.

#include "fleet/columns.h"

#include <fnmatch.h>

#include <algorithm>
#include <array>
#include <numeric>
#include <utility>

#include "fleet/streams.h"

namespace fleet {
namespace {

std::string ValueName(MorwickStream stream, const MorwickKey &key, uint32_t count, uint32_t index) {
  std::array<char, kMorwickNameRoom> name;
  const uint32_t length = MorwickValueName(stream, &key, count, index, name.data());
  return {name.data(), length};
}

// How many letters must be inserted, removed or replaced to turn one text into the other
// (Levenshtein). row[j] is the distance of the part of `one` read so far from the first j letters
// of `other`.
size_t Distance(std::string_view one, std::string_view other) {
  std::vector<size_t> row(other.size() + 1);
  std::iota(row.begin(), row.end(), size_t{0});
  for (size_t i = 0; i < one.size(); ++i) {
    size_t diagonal = std::exchange(row[0], i + 1);
    for (size_t j = 0; j < other.size(); ++j) {
      const size_t replaced = diagonal + (one[i] == other[j] ? 0 : 1);
      diagonal = row[j + 1];
      row[j + 1] = std::min({replaced, row[j] + 1, row[j + 1] + 1});
    }
  }
  return row.back();
}

std::string Lower(std::string text) {
  for (char &c : text) {
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
  }
  return text;
}

// The known name that is closest to this one; names that begin with this one come first.
std::string ClosestName(std::span<const MorwickStream> streams, const std::string &name) {
  const std::string text = Lower(name).substr(0, kMorwickNameRoom);  // bounds the time
  std::vector<std::string> known;
  for (const MorwickStream stream : streams) {
    for (uint32_t i = 0; i < MorwickKeyCount(stream); ++i) {
      const MorwickKey &key = *MorwickKeyAt(stream, i);
      known.emplace_back(key.name);
      if (key.valueCount > 1) known.push_back(ValueName(stream, key, key.valueCount, 0));
    }
  }
  return *std::ranges::min_element(known, {}, [&](const std::string &each) {
    const std::string lower = Lower(each);
    return std::pair(!lower.starts_with(text), Distance(text, lower));
  });
}

// The label of an array that is printed in one line, "name[0..9]".
std::string LabelOf(MorwickStream stream, const MorwickKey &key) {
  std::string label = ValueName(stream, key, key.valueCount, 0);
  label.pop_back();  // the first element's 0
  return label + "[0.." + std::to_string(key.valueCount - 1) + "]";
}

}  // namespace

Selection::Selection(std::span<const MorwickStream> streams, std::span<const std::string> names) {
  const std::string everything = "*";
  for (const std::string &name : names.empty() ? std::span(&everything, 1) : names) {
    const bool isPattern = name.find_first_of("*?[") != std::string::npos;
    bool found = false;
    for (const MorwickStream stream : streams) {
      // A label such as name[0..9] looks like a pattern, so the exact name goes first.
      if (AddAll(stream, name, false) || (isPattern && AddAll(stream, name, true))) found = true;
    }
    if (found) continue;
    if (isPattern) throw UnknownName("no statistic has a name like '" + name + "'");
    throw UnknownName("no statistic has the name '" + name + "'; the closest is " +
                      ClosestName(streams, name));
  }
}

void Selection::Add(MorwickStream stream, const MorwickKey &key, uint32_t index) {
  std::string name = ValueName(stream, key, key.valueCount, index);
  if (!names_.insert(name).second) return;
  columns_.push_back({&key, index, std::move(name)});
  // The parser gives an array's only value a name without an index. Has takes it for the first
  // element.
  if (index == 0) names_.insert(ValueName(stream, key, 1, 0));
}

bool Selection::AddAll(MorwickStream stream, const std::string &name, bool isPattern) {
  const auto matches = [&](const std::string &known) {
    return isPattern ? fnmatch(name.c_str(), known.c_str(), 0) == 0 : name == known;
  };
  bool found = false;
  for (uint32_t i = 0; i < MorwickKeyCount(stream); ++i) {
    const MorwickKey &key = *MorwickKeyAt(stream, i);
    if (!isPattern && !name.starts_with(key.name)) continue;  // only saves time
    const bool isLabel = !isPattern && key.valueCount > 1 && name == LabelOf(stream, key);
    const bool wholeArray = isLabel || matches(key.name);
    for (uint32_t index = 0; index < key.valueCount; ++index) {
      if (!wholeArray && !matches(ValueName(stream, key, key.valueCount, index))) continue;
      Add(stream, key, index);
      found = true;
    }
  }
  return found;
}

ColumnFiller::ColumnFiller(MorwickStream stream, const Selection &selection)
    : stream_(stream), lowestId_(MorwickKeyAt(stream, 0)->id) {
  const uint32_t lastId = MorwickKeyAt(stream, MorwickKeyCount(stream) - 1)->id;
  placeOfKey_.assign(lastId - lowestId_ + 1, kNoColumn);
  for (uint32_t column = 0; column < selection.columns().size(); ++column) {
    const auto &[key, index, name] = selection.columns()[column];
    uint32_t &place = placeOfKey_[key->id - lowestId_];
    if (place == kNoColumn) {
      place = static_cast<uint32_t>(columnOf_.size());
      columnOf_.resize(columnOf_.size() + key->valueCount, kNoColumn);
    }
    columnOf_[place + index] = column;
  }
}

Verdict ColumnFiller::Fill(std::string_view dump, std::span<uint64_t> values,
                           std::span<uint8_t> present) const {
  Judge judge(dump);
  return judge.Finish(WalkRecords(stream_, dump, [&](const MorwickRecord &record) {
    judge.Take(record);
    if (record.valueCount == 0) return;  // also an unknown key, which is null
    const uint32_t place = placeOfKey_[record.key->id - lowestId_];
    // An array's only value has a name without an index, and a table no column for that name.
    if (place == kNoColumn || (record.valueCount == 1 && record.key->valueCount > 1)) return;
    for (uint32_t i = 0; i < record.valueCount; ++i) {
      const uint32_t column = columnOf_[place + i];
      if (column == kNoColumn) continue;
      values[column] = MorwickValue(&record, i);
      present[column] = 1;
    }
  }));
}

}  // namespace fleet
