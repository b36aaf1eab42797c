#include "tools/aligned_table.h"

#include <algorithm>

namespace tools {

void AlignedTable::Add(std::vector<std::string> row) {
  for (size_t i = 0; i < std::min(row.size(), widths_.size()); ++i) Widen(i, row[i].size());
  rows_.push_back(std::move(row));
}

std::vector<std::string> AlignedTable::Lines() const {
  std::vector<std::string> lines;
  for (const std::vector<std::string> &row : rows_) {
    std::string line = row.front();
    line.resize(widths_.front(), ' ');
    for (size_t i = 1; i < row.size(); ++i) {
      const size_t width = i < widths_.size() ? widths_[i] : row[i].size();
      if (width == 0) continue;
      line.append(gap_ + width - row[i].size(), ' ').append(row[i]);
    }
    lines.push_back(std::move(line));
  }
  return lines;
}

void AlignedTable::Print(Output &output) const {
  for (const std::string &line : Lines()) output.Write(line + "\n");
}

}  // namespace tools
