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

// Takes a text as it comes. False when no more is wanted.
using TakeText = std::function<bool(std::string_view text)>;

// In the fixed layout: the legend, a line for each record, and an empty line at the end.
class FixedText {
 public:
  explicit FixedText(TakeText take) : take_(std::move(take)) {}

  // Each is false when no more is wanted.
  bool Begin();
  bool Print(std::string_view block);
  bool End() { return take_("\n"); }

 private:
  std::string_view Render(std::string_view block);

  TakeText take_;
  std::vector<char> text_;
  size_t legend_ = 0;
};

// In the layout of a header, which is whole. A text of a record that is longer than kMostText
// is passed over.
class DescribedText {
 public:
  static constexpr size_t kMostText = 8 << 20;

  DescribedText(TakeText take, std::string header);

  // Prints the records of a block; in front of each block but the first lies room of one record,
  // which may be read. `passedOver` is called with the index of a record that does not fit. False
  // when no more is wanted.
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
