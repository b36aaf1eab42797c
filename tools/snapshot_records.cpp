#include "tools/snapshot_records.h"

#include <algorithm>
#include <cstring>

namespace tools {
namespace {

constexpr size_t kBlockSize = 64 << 10;  // bytes; stays in the cache

}  // namespace

SnapshotRecords::SnapshotRecords(ReadBytes read, size_t recordSize, uint64_t most)
    : read_(std::move(read)),
      recordSize_(recordSize),
      most_(most),
      buffer_(recordSize + std::max(kBlockSize, recordSize + 1), '\0') {}

bool SnapshotRecords::Load() { return Load(recordSize_); }

bool SnapshotRecords::Load(size_t size) {
  // The beginning of the next record moves to the front.
  char *front = buffer_.data() + recordSize_;
  filled_ -= used_;
  std::memmove(front, front + used_, filled_);
  used_ = 0;
  while (filled_ < size) {
    const auto count = read_(front + filled_, buffer_.size() - recordSize_ - filled_);
    if (!count) return false;
    if (*count == 0) break;
    filled_ += *count;
  }
  return true;
}

bool SnapshotRecords::ForEachBlock(const TakeBlock &take) {
  for (;;) {
    // After the last record, a byte more than a record tells whether the snapshot goes on.
    if (!Load(recordSize_ + (count_ == most_ ? 1 : 0))) return false;
    const uint64_t count = std::min<uint64_t>(filled_ / recordSize_, most_ - count_);
    count_ += count;
    used_ = count * recordSize_;
    if (count == 0 || !take(std::string_view(buffer_).substr(recordSize_, used_))) return true;
  }
}

}  // namespace tools
