// The numbers of a snapshot's records as columns, in any layout.
#ifndef TOOLS_SNAPSHOT_COLUMNS_H
#define TOOLS_SNAPSHOT_COLUMNS_H

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "morwick/snapshot_fields.h"

namespace tools {

struct SnapshotColumn {
  std::string name;  // unique, in UTF-8
  std::string label;
  MorwickFieldKind kind;
  uint32_t offset;  // of its 32 bits in the record
};

class SnapshotColumns {
 public:
  // A column for each number, in the order of the text. Null stands for the fixed layout; any other
  // header must have passed fleet::CheckSnapshotHeader.
  explicit SnapshotColumns(const char *header);

  // Why the records cannot be a table; empty when they can.
  const std::string &fault() const { return fault_; }

  const std::vector<SnapshotColumn> &all() const { return columns_; }

  // The offsets of the numbers with that label, one for each priority. Thousandths are left out.
  std::vector<uint32_t> OffsetsOf(std::string_view label) const;

  // Whether the text leaves the record out. The record must be whole, and fault() empty.
  bool LeavesOut(std::string_view record) const;

 private:
  std::vector<SnapshotColumn> columns_;
  std::string fault_;
  bool fixed_;
  uint32_t emptyOffset_ = 0;  // of 32 bits that are 0 in a record that is left out
};

}  // namespace tools

#endif
