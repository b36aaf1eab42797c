// Lines on a terminal that are drawn again and again in the same place.

#include "tools/redrawn_block.h"

#include <fmt/format.h>

#include <algorithm>

#include "tools/messages.h"

namespace tools {

void RedrawnBlock::Draw(std::vector<std::string> lines) {
  lines_ = std::move(lines);
  DrawAgain();
}

void RedrawnBlock::DrawAgain() {
  const auto [rows, columns] = Output::Window();
  // After a resize, a line that is wider than the window takes several of its rows.
  size_t up = 0;
  for (const size_t length : drawn_) up += length == 0 ? 1 : (length + columns - 1) / columns;
  if (printed_ == LinesPrinted() && up > 0) {
    output_.Control(fmt::format("\r\033[{}A\033[J", std::min(up, rows - 1)));
  }
  printed_ = LinesPrinted();
  drawn_.clear();
  const size_t most = rows - 1;  // the cursor needs the last row
  for (size_t i = 0; i < std::min(lines_.size(), most); ++i) {
    const bool cut = i + 1 == most && lines_.size() > most;
    const std::string line =
        cut ? fmt::format("... and {} lines more", lines_.size() - i) : lines_[i];
    drawn_.push_back(std::min(line.size(), columns));
    output_.Write(line.substr(0, columns));
    output_.Write("\n");
  }
  output_.Flush();
}

}  // namespace tools
