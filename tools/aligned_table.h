// Texts in columns, for people.
#ifndef TOOLS_ALIGNED_TABLE_H
#define TOOLS_ALIGNED_TABLE_H

#include <string>
#include <vector>

#include "tools/io.h"

namespace tools {

// Rows of cells. The first column is left-aligned, the others are right-aligned; a cell behind the
// last of them, such as a remark, may follow.
class AlignedTable {
 public:
  // `columns` counts those that are aligned. At least `gap` blanks stand between two.
  explicit AlignedTable(size_t columns, size_t gap = 2) : widths_(columns), gap_(gap) {}

  // A column is at least so wide.
  void Widen(size_t column, size_t width) { widths_[column] = std::max(widths_[column], width); }

  void Add(std::vector<std::string> row);

  // The lines; a column without any text is left out.
  std::vector<std::string> Lines() const;
  void Print(Output &output) const;

 private:
  std::vector<size_t> widths_;
  size_t gap_;
  std::vector<std::vector<std::string>> rows_;
};

}  // namespace tools

#endif
