// The records of a snapshot, in blocks, as they arrive.
#ifndef TOOLS_SNAPSHOT_RECORDS_H
#define TOOLS_SNAPSHOT_RECORDS_H

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

namespace tools {

class SnapshotRecords {
 public:
  // Reads at most `room` bytes; 0 at the end. Returns nothing when reading has failed.
  using ReadBytes = std::function<std::optional<size_t>(char *bytes, size_t room)>;
  // Takes a block of whole records. The bytes of one record before it may be read, which
  // fleet::DescribedText needs. Returning false ends the reading.
  using TakeBlock = std::function<bool(std::string_view block)>;

  // Hands out no more than `most` records.
  SnapshotRecords(ReadBytes read, size_t recordSize, uint64_t most);

  // Reads until there is a whole record, or the end. False when reading has failed.
  bool Load();

  // Hands out the blocks as they come. False when reading has failed.
  bool ForEachBlock(const TakeBlock &take);

  // The bytes that were read and not handed out yet.
  std::string_view loaded() const {
    return std::string_view(buffer_).substr(recordSize_ + used_, filled_ - used_);
  }

  size_t recordSize() const { return recordSize_; }

  // How many records were handed out.
  uint64_t count() const { return count_; }

  // How many bytes were read and not handed out; ask before ForEachBlock or after its last block.
  // When they are more than a record, others may follow that were not read.
  size_t rest() const { return filled_; }

 private:
  // Reads until `size` bytes are there, or the end.
  bool Load(size_t size);

  ReadBytes read_;
  size_t recordSize_;
  uint64_t most_;
  uint64_t count_ = 0;
  std::string buffer_;
  size_t filled_ = 0;  // bytes, after the room of one record
  size_t used_ = 0;    // of these, in the block that was handed out
};

}  // namespace tools

#endif
