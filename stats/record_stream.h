// The 64-bit statistics record stream: records of one header word and `length` payload words, end
// to end. What to do with a record is the reader's own business.
#ifndef STATS_RECORD_STREAM_H
#define STATS_RECORD_STREAM_H

#include <cstdint>

#include "morwick/little_endian.h"

namespace morwick {

constexpr uint32_t kWordSize = 8;
constexpr uint32_t kHighestId = 0x30000000;  // a header with a key id above it is bad

struct Record {
  uint32_t id;
  uint32_t length;         // of the payload, in words
  const uint8_t *payload;  // just past the header; not more than `wordsLeft` words may be read
};

// Reads headers in turn and never leaves the buffer; a last part of a word is not looked at.
class RecordStream {
 public:
  RecordStream(const void *buffer, uint32_t size)
      : position_(static_cast<const uint8_t *>(buffer)), wordsLeft_(size / kWordSize) {}

  // Words that no header or skipped payload has consumed yet.
  uint32_t wordsLeft() const { return wordsLeft_; }

  // Takes the header at the position. There must be a word left.
  Record TakeHeader() {
    const Record record = {LoadLittleEndian32(position_), LoadLittleEndian32(position_ + 4),
                           position_ + kWordSize};
    Skip(1);
    return record;
  }

  // Steps over a payload of at most the words left.
  void Skip(uint32_t words) {
    position_ += size_t{words} * kWordSize;
    wordsLeft_ -= words;
  }

 private:
  const uint8_t *position_;
  uint32_t wordsLeft_;
};

}  // namespace morwick

#endif
