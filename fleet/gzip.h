// Reads data that may be compressed by gzip.
#ifndef FLEET_GZIP_H
#define FLEET_GZIP_H

#include <cstddef>
#include <functional>
#include <memory>
#include <string>

namespace fleet {

// The result of reading.
struct ReadResult {
  size_t count = 0;   // bytes; 0 at the end
  std::string fault;  // why reading failed; empty when it did not
};

// Reads up to `room` bytes; 0 only at the end.
using ReadBytes = std::function<ReadResult(char *bytes, size_t room)>;

// Returns what it reads, unpacked when the first two bytes are those of gzip. Several members are
// read as one text.
class GzipReader {
 public:
  explicit GzipReader(ReadBytes read);
  ~GzipReader();

  // Bytes before a fault are returned by earlier calls.
  ReadResult Read(char *bytes, size_t room);

 private:
  struct Inflation;

  ReadResult ReadFirst(char *bytes, size_t room);
  ReadResult Inflate(char *bytes, size_t room);

  ReadBytes read_;
  bool begun_ = false;
  std::unique_ptr<Inflation> inflation_;  // null for data that is not compressed
};

}  // namespace fleet

#endif
