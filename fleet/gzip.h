// Reads data that may be compressed by gzip.
#ifndef FLEET_GZIP_H
#define FLEET_GZIP_H

#include <cstddef>
#include <functional>
#include <memory>
#include <string>

namespace fleet {

struct ReadResult {
  size_t count = 0;   // bytes; 0 at the end
  std::string fault;  // why reading failed; empty when it did not
};

// Reads up to `room` bytes; 0 only at the end.
using ReadBytes = std::function<ReadResult(char *bytes, size_t room)>;

// Returns the bytes that it reads, unpacked when the first two are those of gzip. Gzip members that
// follow each other are read as one.
class GzipReader {
 public:
  explicit GzipReader(ReadBytes read);
  ~GzipReader();

  // Reads up to `room` bytes, which is at least 1. The bytes before a fault are returned first, and
  // the fault by a later call.
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
