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

// In bytes. The first two are more than the fixed layout's legend and its longest line take.
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

// The library gets each block as a snapshot of its own, with a record count that is one too high:
// it leaves out the last record that a header promises.
bool DescribedText::Print(std::string_view block,
                          const std::function<void(uint32_t index)> &passedOver) {
  const auto count = static_cast<uint32_t>(block.size() / recordSize_);
  for (uint32_t next = 0; next < count;) {
    // At state 0 the library prints the banner. Once it is written, a call begins at state 1, and
    // the record in front of the next one stands for record 0, which is skipped.
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
    // Print the record that did not fit again: first in the text or, if it was first, in more room.
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
