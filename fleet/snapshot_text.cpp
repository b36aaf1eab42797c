// Snapshots as the library's text.

#include "fleet/snapshot_text.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "fleet/snapshot_header.h"
#include "morwick/little_endian.h"
#include "morwick/snapshot.h"

namespace fleet {
namespace {

constexpr size_t kLegendRoom = 2048;
constexpr size_t kLineRoom = 1024;  // of the fixed layout: more than the longest line
constexpr size_t kLeastRoom = 64 << 10;

}  // namespace

// Without the empty line.
std::string_view FixedText::Render(std::string_view block) {
  text_.resize(
      std::max(text_.size(), kLegendRoom + block.size() / sizeof(SnapshotRecord) * kLineRoom));
  uint64_t length = text_.size();
  KVRParseSnapshotBuffer(block.data(), block.size(), text_.data(), &length);
  return {text_.data(), length - 1};
}

bool FixedText::Begin() {
  const std::string_view legend = Render({});
  legend_ = legend.size();
  return take_(legend);
}

bool FixedText::Print(std::string_view block) { return take_(Render(block).substr(legend_)); }

DescribedText::DescribedText(TakeText take, std::string header)
    : take_(std::move(take)),
      header_(std::move(header)),
      recordSize_(LoadSnapshotHeader(header_).recordSize),
      text_(kLeastRoom) {}

// The library is given each block as a snapshot of its own, whose header has the block's record
// count.
bool DescribedText::Print(std::string_view block,
                          const std::function<void(uint32_t index)> &passedOver) {
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
                          first, size_t{recordSize_} * (count - next + before), text_.data(), &size,
                          header_.data(), &state) == 1;
    if (size > 1) {
      bannerWritten_ = true;
      if (!take_({text_.data(), size - 1})) return false;
    }
    if (done) return true;
    // The record that did not fit comes again, with the room to itself or, when it had that
    // already, with more of it.
    if (state > 0) next += state - before - 1;
    if (size == 1 && !GrowText()) passedOver(next++);
  }
  return true;
}

void DescribedText::SetRecordCount(uint32_t count) {
  const uint32_t stored = LittleEndian32(count);
  std::memcpy(&header_[offsetof(SnapshotHeader, recordCount)], &stored, sizeof stored);
}

bool DescribedText::GrowText() {
  if (text_.size() == kMostText) return false;
  const size_t room = text_.size() * 2;
  text_ = {};  // given back first: the old text is not needed
  text_.resize(room);
  return true;
}

}  // namespace fleet
