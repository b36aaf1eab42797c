// Snapshots as the library's text, block by block.

#include "tools/snapshot_text.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <vector>

#include "morwick/little_endian.h"
#include "morwick/snapshot.h"
#include "tools/snapshot_header.h"

namespace tools {
namespace {

constexpr size_t kLegendRoom = 2048;
constexpr size_t kLineRoom = 1024;  // of the fixed layout: more than the longest line
constexpr size_t kLeastRoom = 64 << 10;
constexpr size_t kMostRoom = 8 << 20;

// Prints the blocks of a snapshot in the layout of its header. The library is given each block as a
// snapshot of its own, whose header has the block's record count.
class DescribedText {
 public:
  DescribedText(Output &output, const std::string &header)
      : output_(output),
        header_(header),
        recordSize_(LoadSnapshotHeader(header).recordSize),
        text_(kLeastRoom) {}

  // Prints the records of a block; in front of it lies room of one record. False when writing has
  // failed. `passedOver` is called with the index of a record that does not fit.
  template <typename PassedOver>
  bool Print(std::string_view block, PassedOver passedOver) {
    const auto count = static_cast<uint32_t>(block.size() / recordSize_);
    for (uint32_t next = 0; next < count;) {
      // The banner belongs to state 0. Once it is written, the record before the next one takes the
      // place of record 0.
      const uint32_t before = bannerWritten_ ? 1 : 0;
      const char *first = block.data() + size_t{recordSize_} * next - size_t{recordSize_} * before;
      SetRecordCount(count - next + before + 1);
      uint32_t state = before;
      uint64_t size = text_.size();
      const bool done = KVRParseSnapshotBufferWithInplaceParser(
                            first, size_t{recordSize_} * (count - next + before), text_.data(),
                            &size, header_.data(), &state) == 1;
      if (size > 1) {
        bannerWritten_ = true;
        if (!output_.Write({text_.data(), size - 1})) return false;
      }
      if (done) return true;
      // The record that did not fit comes again, with the room to itself or, when it had that
      // already, with more of it.
      if (state > 0) next += state - before - 1;
      if (size == 1 && !GrowText()) passedOver(next++);
    }
    return true;
  }

 private:
  void SetRecordCount(uint32_t count) {
    const uint32_t stored = LittleEndian32(count);
    std::memcpy(&header_[offsetof(SnapshotHeader, recordCount)], &stored, sizeof stored);
  }

  bool GrowText() {
    if (text_.size() == kMostRoom) return false;
    const size_t room = text_.size() * 2;
    text_ = {};  // given back first: the old text is not needed
    text_.resize(room);
    return true;
  }

  Output &output_;
  std::string header_;
  uint32_t recordSize_;
  std::vector<char> text_;
  bool bannerWritten_ = false;
};

}  // namespace

bool PrintFixedText(Output &output, SnapshotRecords &records) {
  std::vector<char> text(kLegendRoom);
  const auto render = [&](std::string_view block) {
    text.resize(
        std::max(text.size(), kLegendRoom + block.size() / sizeof(SnapshotRecord) * kLineRoom));
    uint64_t length = text.size();
    KVRParseSnapshotBuffer(block.data(), block.size(), text.data(), &length);
    return std::string_view(text.data(), length - 1);  // without the empty line
  };
  const size_t legend = render({}).size();
  output.Write(render({}));
  for (;;) {
    const auto block = records.Next();
    if (!block) return false;
    if (block->empty()) break;
    if (!output.Write(render(*block).substr(legend)) || !output.Flush()) return false;
  }
  return output.Write("\n");
}

Status PrintDescribedText(Output &output, SnapshotRecords &records, const std::string &header,
                          const std::string &name) {
  DescribedText text(output, header);
  const std::string tooLong = " a text of " + std::to_string(kMostRoom) + " bytes";
  RepeatedComplaint passedOver(name);
  bool good = true;  // reading
  for (bool goesOn = true; goesOn;) {
    const uint64_t first = records.count();
    const auto block = records.Next();
    good = block.has_value();
    if (!good || block->empty()) break;
    const auto passOver = [&](uint32_t index) {
      passedOver.Add(
          [&] { return "record " + std::to_string(first + index) + " does not fit" + tooLong; });
    };
    goesOn = text.Print(*block, passOver) && output.Flush();
  }
  const bool all = !passedOver.Finish("records do not fit" + tooLong);
  return !good ? kBadUsage : all ? kGood : kBadData;
}

}  // namespace tools
