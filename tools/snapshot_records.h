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
  // Reads at most `room` bytes, none at the end. Without a value, reading has failed.
  using ReadBytes = std::function<std::optional<size_t>(char *bytes, size_t room)>;
  // Takes a block of whole records, in front of which lies room of one record that may be read.
  // False ends the reading.
  using TakeBlock = std::function<bool(std::string_view block)>;

  // Hands out no more than `most` records.
  SnapshotRecords(ReadBytes read, size_t recordSize, uint64_t most);

  // Reads until there is a whole record, or the end. False when reading has failed.
  bool Load();

  // Hands out the blocks as they come. False when reading has failed.
  bool ForEachBlock(const TakeBlock &take);

  // What was read, and not handed out yet.
  std::string_view loaded() const {
    return std::string_view(buffer_).substr(recordSize_ + used_, filled_ - used_);
  }

  size_t recordSize() const { return recordSize_; }

  // How many records were handed out.
  uint64_t count() const { return count_; }

  // At the end: bytes that no record has that was handed out, up to more than one record of them.
  size_t rest() const { return filled_; }

 private:
  // Reads until so much is there, or the end.
  bool Load(size_t size);

  ReadBytes read_;
  size_t recordSize_;
  uint64_t most_;
  uint64_t count_ = 0;
  std::string buffer_;
  size_t filled_ = 0;  // after the room of one record
  size_t used_ = 0;    // of what is filled, the block that was handed out
};

}  // namespace tools

#endif
