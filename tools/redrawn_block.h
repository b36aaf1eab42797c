// Lines on a terminal that are drawn again and again in the same place.
#ifndef TOOLS_REDRAWN_BLOCK_H
#define TOOLS_REDRAWN_BLOCK_H

#include <string>
#include <vector>

#include "tools/io.h"

namespace tools {

// Changes no mode of the terminal: whatever ends the process, nothing needs to be put back.
class RedrawnBlock {
 public:
  explicit RedrawnBlock(Output &output) : output_(output) {}

  // Draws the lines over those that were drawn last, cut to the window as it is now. Where
  // something was said in between it stays, and the lines begin below it.
  void Draw(std::vector<std::string> lines);

  // The same once more, for a window of another size.
  void DrawAgain();

 private:
  Output &output_;
  std::vector<std::string> lines_;
  std::vector<size_t> drawn_;  // the length of each line on the screen
  uint64_t said_ = 0;
};

}  // namespace tools

#endif
