// Snapshots as the library's text, block by block.
#ifndef FLEET_SNAPSHOT_TEXT_H
#define FLEET_SNAPSHOT_TEXT_H

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace fleet {

// Gets the text piece by piece. Returns false to end the rendering.
using TakeText = std::function<bool(std::string_view text)>;

// Text of the fixed layout: the legend, a line for each record, and an empty line at the end.
class FixedText {
 public:
  explicit FixedText(TakeText take) : take_(std::move(take)) {}

  // Each returns false when `take` has ended the rendering.
  bool Begin();
  bool Print(std::string_view block);
  bool End() { return take_("\n"); }

 private:
  std::string_view Render(std::string_view block);

  TakeText take_;
  std::vector<char> text_;
  size_t legendSize_ = 0;
};

// Text of the layout that a whole header describes. It passes over records whose text is longer
// than kMostText bytes.
class DescribedText {
 public:
  static constexpr size_t kMostText = 8 << 20;

  DescribedText(TakeText take, std::string header);

  // Prints the records of a block. Before each block except the first, the bytes of one record
  // must be readable; they may be any. Calls `passedOver` with the index in the block of each
  // record that does not fit. False when `take` has ended the rendering.
  bool Print(std::string_view block, const std::function<void(uint32_t index)> &passedOver);

 private:
  void SetRecordCount(uint32_t count);
  bool GrowText();

  TakeText take_;
  std::string header_;
  uint32_t recordSize_;
  std::vector<char> text_;
  bool bannerWritten_ = false;
};

}  // namespace fleet

#endif
