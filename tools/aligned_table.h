// A table with aligned columns, for people.
#ifndef TOOLS_ALIGNED_TABLE_H
#define TOOLS_ALIGNED_TABLE_H

#include <string>
#include <vector>

#include "tools/output.h"

namespace tools {

// Rows of cells. The first column is left-aligned, the others are right-aligned. One more cell,
// such as a remark, may follow the last column.
class AlignedTable {
 public:
  // `columns` is the number of aligned columns; at least `gap` blanks stand between two of them.
  explicit AlignedTable(size_t columns, size_t gap = 2) : widths_(columns), gap_(gap) {}

  // Makes a column at least that wide.
  void Widen(size_t column, size_t width) { widths_[column] = std::max(widths_[column], width); }

  void Add(std::vector<std::string> row);

  // The lines, without columns that are empty in all rows.
  std::vector<std::string> Lines() const;
  void Print(Output &output) const;

 private:
  std::vector<size_t> widths_;
  size_t gap_;
  std::vector<std::vector<std::string>> rows_;
};

}  // namespace tools

#endif
