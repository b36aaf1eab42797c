// Dumps as files.

#include "fleet/dump.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <new>

namespace fleet {
namespace {

constexpr size_t kFirstRoom = 256 << 10;

class OpenFile {
 public:
  explicit OpenFile(int descriptor) : descriptor_(descriptor) {}
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
  struct stat status = {};
  if (onlyFiles && stat(name, &status) == 0 && !S_ISREG(status.st_mode)) {
    return {{}, "not a regular file"};
  }
  // O_NONBLOCK: a pipe may have taken the file's place, and opening it would wait for a writer.
  const OpenFile file(std::strcmp(name, "-") == 0
                          ? fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 0)
                          : open(name, O_RDONLY | O_CLOEXEC | (onlyFiles ? O_NONBLOCK : 0)));
  if (file.descriptor() < 0) return {{}, Fault(errno)};
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
    ReadResult more = reader.Read(buffer_.get() + size, capacity_ - size);
    size += more.count;
    if (size > kLargestDump) more.fault = TooLarge(kLargestDump);
    if (more.count == 0 || !more.fault.empty()) return {{buffer_.get(), size}, more.fault};
  }
}

// Up to one byte above the limit, which is enough to notice a larger dump. The C library moves
// large blocks without a second copy in memory.
void DumpReader::Grow() {
  const size_t capacity = std::min<size_t>(std::max(kFirstRoom, capacity_ * 2), kLargestDump + 1);
  auto *bytes = static_cast<char *>(std::realloc(buffer_.get(), capacity));
  if (bytes == nullptr) throw std::bad_alloc();
  static_cast<void>(buffer_.release());
  buffer_.reset(bytes);
  capacity_ = capacity;
}

}  // namespace fleet
