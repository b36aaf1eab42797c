// Lines on a terminal that are drawn again and again in the same place.
#ifndef TOOLS_REDRAWN_BLOCK_H
#define TOOLS_REDRAWN_BLOCK_H

#include <string>
#include <vector>

#include "tools/output.h"

namespace tools {

// It changes no mode of the terminal, so that nothing must be restored when the process ends.
class RedrawnBlock {
 public:
  explicit RedrawnBlock(Output &output) : output_(output) {}

  // Draws the lines over the last ones, cut to the size of the window. When a message was printed
  // in between, it stays, and the lines begin below it.
  void Draw(std::vector<std::string> lines);

  // Draws the last lines again, because the size of the window has changed.
  void DrawAgain();

  // The next lines go below what is on the screen: another program has written there.
  void Forget() { drawn_.clear(); }

 private:
  Output &output_;
  std::vector<std::string> lines_;
  std::vector<size_t> drawn_;  // the length of each line on the screen
  uint64_t printed_ = 0;
};

}  // namespace tools

#endif
