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

// In bytes. The fixed layout's legend and longest line take less than the first two.
constexpr size_t kLegendRoom = 2048;
constexpr size_t kLineRoom = 1024;
constexpr size_t kFirstRoom = 64 << 10;

}  // namespace

// Returns the library's text without the empty line at its end.
std::string_view FixedText::Render(std::string_view block) {
  text_.resize(
      std::max(text_.size(), kLegendRoom + block.size() / sizeof(SnapshotRecord) * kLineRoom));
  uint64_t length = text_.size();
  KVRParseSnapshotBuffer(block.data(), block.size(), text_.data(), &length);
  return {text_.data(), length - 1};
}

bool FixedText::Begin() {
  const std::string_view legend = Render({});
  legendSize_ = legend.size();
  return take_(legend);
}

bool FixedText::Print(std::string_view block) { return take_(Render(block).substr(legendSize_)); }

DescribedText::DescribedText(TakeText take, std::string header)
    : take_(std::move(take)),
      header_(std::move(header)),
      recordSize_(LoadSnapshotHeader(header_).recordSize),
      text_(kFirstRoom) {}

// The library never prints the last record that a header counts. So it gets each block as a
// snapshot of its own, with a count that is one higher than the number of its records.
bool DescribedText::Print(std::string_view block,
                          const std::function<void(uint32_t index)> &passedOver) {
  const auto count = static_cast<uint32_t>(block.size() / recordSize_);
  for (uint32_t next = 0; next < count;) {
    // The library prints the banner only at state 0. After the banner a call begins at state 1: the
    // library skips record 0, and the record before the next one takes that place.
    const uint32_t skipped = bannerWritten_ ? 1 : 0;
    const char *first = block.data() + size_t{recordSize_} * next - size_t{recordSize_} * skipped;
    SetRecordCount(count - next + skipped + 1);
    uint32_t state = skipped;
    uint64_t size = text_.size();
    const bool done = KVRParseSnapshotBufferWithInplaceParser(
                          first, size_t{recordSize_} * (count - next + skipped), text_.data(),
                          &size, header_.data(), &state) == 1;
    if (size > 1) {
      bannerWritten_ = true;
      if (!take_({text_.data(), size - 1})) return false;
    }
    if (done) return true;
    // The library went past the record that did not fit, hence - 1. Try it again: at the start of
    // an empty text, or with more room if the text was already empty.
    if (state > 0) next += state - skipped - 1;
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
  text_ = {};  // freed first, as the old text is not needed
  text_.resize(room);
  return true;
}

}  // namespace fleet
