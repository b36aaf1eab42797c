// Data that may be compressed by gzip, read as what it contains.
#ifndef FLEET_GZIP_H
#define FLEET_GZIP_H

#include <cstddef>
#include <functional>
#include <memory>
#include <string>

namespace fleet {

// What came of a call that reads.
struct ReadResult {
  size_t count = 0;   // of bytes; 0 at the end
  std::string fault;  // why reading failed, in words; empty when it did not
};

// Reads from somewhere at most `room` bytes, at least one but at the end.
using ReadBytes = std::function<ReadResult(char *bytes, size_t room)>;

// Hands on what it reads, unpacked when the first two bytes are those of gzip. What is compressed
// in several members is read as a whole.
class GzipReader {
 public:
  explicit GzipReader(ReadBytes read);
  ~GzipReader();
  GzipReader(const GzipReader &) = delete;
  GzipReader &operator=(const GzipReader &) = delete;

  // What was unpacked before a fault has been handed out before.
  ReadResult Read(char *bytes, size_t room);

 private:
  struct Inflation;

  ReadResult ReadFirst(char *bytes, size_t room);
  ReadResult Inflate(char *bytes, size_t room);

  ReadBytes read_;
  bool begun_ = false;
  std::unique_ptr<Inflation> inflation_;  // none for what is not compressed
};

}  // namespace fleet

#endif
