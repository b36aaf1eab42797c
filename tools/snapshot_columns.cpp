// The numbers of a snapshot's records as columns.

#include "tools/snapshot_columns.h"

#include <algorithm>
#include <set>

#include "fleet/snapshot_header.h"
#include "morwick/little_endian.h"
#include "tools/text.h"

namespace tools {
namespace {

constexpr uint64_t kMostColumns = 16384;

}  // namespace

SnapshotColumns::SnapshotColumns(const char *header)
    : fault_(fleet::CheckFieldCount(header)), fixed_(header == nullptr) {
  if (!fault_.empty()) return;
  std::set<std::string> names;
  MorwickSnapshotField field;
  for (uint32_t i = 0; MorwickSnapshotFieldAt(header, i, &field) != 0; ++i) {
    if (i == 0) emptyOffset_ = field.offset;
    if (columns_.size() + field.priorities * 3ULL > kMostColumns) {
      fault_ = "describes more than " + std::to_string(kMostColumns) + " numbers";
      columns_.clear();
      return;
    }
    if (field.kind == kMorwickFieldWithoutNumber) continue;
    const bool isTriple = field.kind == kMorwickFieldPriorities;
    for (uint32_t part = 0; part < (isTriple ? 3 : 1); ++part) {
      const auto &[label, column] = field.names[part];
      for (uint32_t priority = 0; priority < std::max(field.priorities, 1U); ++priority) {
        std::string name =
            ValidText(column);  // as JSON does; two names must not become equal there
        if (isTriple) name.append("_").append(std::to_string(priority));
        // Labels differ, but one may be RO_0, which is also the first name of the priorities RO.
        while (!names.insert(name).second) name += "_2";
        const size_t offset =
            field.offset + priority * sizeof(SnapshotOperations) + part * sizeof(uint32_t);
        columns_.push_back({name, label, field.kind, static_cast<uint32_t>(offset)});
      }
    }
  }
  if (columns_.empty()) fault_ = "describes no number that is printed";
}

std::vector<uint32_t> SnapshotColumns::OffsetsOf(std::string_view label) const {
  std::vector<uint32_t> offsets;
  for (const SnapshotColumn &column : columns_) {
    if (column.label == label && column.kind != kMorwickFieldThousandths) {
      offsets.push_back(column.offset);
    }
  }
  return offsets;
}

bool SnapshotColumns::LeavesOut(std::string_view record) const {
  return !fixed_ && LoadLittleEndian32(&record[emptyOffset_]) == 0;
}

}  // namespace tools
