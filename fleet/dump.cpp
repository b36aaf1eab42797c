// Dumps as files.

#include "fleet/dump.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace fleet {
namespace {

constexpr size_t kFirstRoom = 256 << 10;

class OpenFile {
 public:
  OpenFile(const char *name, int flags) : descriptor_(open(name, flags | O_RDONLY | O_CLOEXEC)) {}
  ~OpenFile() {
    if (descriptor_ >= 0) close(descriptor_);
  }
  OpenFile(const OpenFile &) = delete;
  OpenFile &operator=(const OpenFile &) = delete;

  int descriptor() const { return descriptor_; }

 private:
  int descriptor_;
};

std::string Fault(int error) { return std::strerror(error); }

}  // namespace

std::string TooLarge(uint64_t limit) { return "larger than " + std::to_string(limit) + " bytes"; }

DumpReader::Dump DumpReader::Read(const char *name, bool onlyFiles) {
  // Opening a pipe waits for somebody who writes to it.
  const bool isInput = std::strcmp(name, "-") == 0;
  const OpenFile file(isInput ? "/dev/stdin" : name, onlyFiles ? O_NONBLOCK : 0);
  if (file.descriptor() < 0) return {{}, Fault(errno)};
  struct stat status = {};
  if (onlyFiles && fstat(file.descriptor(), &status) == 0 && !S_ISREG(status.st_mode)) {
    return {{}, "not a regular file"};
  }
  GzipReader reader([&](char *bytes, size_t room) -> ReadResult {
    for (;;) {
      const ssize_t count = read(file.descriptor(), bytes, room);
      if (count >= 0) return {static_cast<size_t>(count), ""};
      if (errno != EINTR) return {0, Fault(errno)};
    }
  });
  size_t size = 0;
  for (;;) {
    if (size == capacity_) Grow();
    // One byte above the limit is enough to know.
    const size_t room = std::min<size_t>(capacity_, kLargestDump + 1) - size;
    ReadResult more = reader.Read(buffer_.get() + size, room);
    size += more.count;
    if (size > kLargestDump) more.fault = TooLarge(kLargestDump);
    if (more.count == 0 || !more.fault.empty()) return {{buffer_.get(), size}, more.fault};
  }
}

// Dumps of the usual size never come here again.
char *DumpReader::Grow() {
  const size_t capacity = capacity_ == 0 ? kFirstRoom : capacity_ * 2;
  auto buffer = std::make_unique_for_overwrite<char[]>(capacity);
  std::copy_n(buffer_.get(), capacity_, buffer.get());
  buffer_ = std::move(buffer);
  capacity_ = capacity;
  return buffer_.get();
}

}  // namespace fleet
