// Dumps as files.

#include "fleet/dump.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <new>

#include "fleet/descriptor.h"

namespace fleet {
namespace {

constexpr size_t kFirstRoom = 256 << 10;  // bytes; ten times a dump of every key

}  // namespace

std::string TooLarge(uint64_t limit) { return "larger than " + std::to_string(limit) + " bytes"; }

DumpReader::Dump DumpReader::Read(const char *name, bool onlyFiles) {
  struct stat status = {};
  if (onlyFiles && stat(name, &status) == 0 && !S_ISREG(status.st_mode)) {
    return {{}, "not a regular file"};
  }
  // O_NONBLOCK: a pipe may have taken the file's place, and opening it would wait for a writer.
  const Descriptor file(std::strcmp(name, "-") == 0
                            ? fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 0)
                            : open(name, O_RDONLY | O_CLOEXEC | (onlyFiles ? O_NONBLOCK : 0)));
  if (!file.isOpen()) return {{}, std::strerror(errno)};
  GzipReader reader([&](char *bytes, size_t room) -> ReadResult {
    for (;;) {
      const ssize_t count = read(file.number(), bytes, room);
      if (count >= 0) return {static_cast<size_t>(count), ""};
      // A named file may be waited for, but not a pipe that has taken a file's place.
      if (onlyFiles ? errno != EINTR : !CanTryAgain(file.number(), POLLIN)) {
        return {0, std::strerror(errno)};
      }
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

// Grows up to one byte above the limit, which is enough to notice a larger dump. realloc, unlike a
// vector, moves large blocks without a second copy in memory.
void DumpReader::Grow() {
  const size_t capacity = std::min<size_t>(std::max(kFirstRoom, capacity_ * 2), kLargestDump + 1);
  auto *bytes = static_cast<char *>(std::realloc(buffer_.get(), capacity));
  if (bytes == nullptr) throw std::bad_alloc();
  static_cast<void>(buffer_.release());
  buffer_.reset(bytes);
  capacity_ = capacity;
}

}  // namespace fleet
