// What the morwick command reads.

#include "tools/input.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "fleet/dump.h"
#include "tools/text.h"

namespace tools {
namespace {

constexpr size_t kBlockSize = 64 << 10;  // bytes

}  // namespace

std::string DisplayName(const std::string &file) {
  if (file.empty()) return "''";
  return file == "-" ? "standard input" : file;
}

Input::Input(const std::string &file, bool showProgress)
    : name_(DisplayName(file)),
      file_(file == "-" ? -1 : open(file.c_str(), O_RDONLY | O_CLOEXEC)),
      descriptor_(file == "-" ? STDIN_FILENO : file_.number()),
      progress_(showProgress && isatty(STDERR_FILENO) != 0, std::chrono::seconds(1)) {
  struct stat status = {};
  if (fstat(descriptor_, &status) == 0 && S_ISREG(status.st_mode)) {
    size_ = static_cast<uint64_t>(status.st_size);
  }
}

std::optional<size_t> Input::Read(char *bytes, size_t room) {
  fleet::ReadResult result = reader_.Read(bytes, room);
  if (result.fault.empty()) return result.count;
  ComplainOf(result.fault);
  return std::nullopt;
}

fleet::ReadResult Input::ReadRaw(char *bytes, size_t room) {
  while (error_ == 0) {
    const ssize_t count = read(descriptor_, bytes, room);
    if (count >= 0) {
      bytesRead_ += static_cast<size_t>(count);
      if (progress_.IsDue()) {
        const std::string total = size_ == 0 ? "" : fmt::format(" of {}", size_ >> 10);
        fmt::print(stderr, "\rmorwick: {}: {}{} KiB read", PrintableLine(name_), bytesRead_ >> 10,
                   total);
      }
      return {static_cast<size_t>(count), ""};
    }
    if (!fleet::CanTryAgain(descriptor_, POLLIN)) error_ = errno;
  }
  return {0, std::strerror(error_)};
}

void Input::ComplainOf(const std::string &fault) {
  progress_.Clear();
  Complain(name_, fault);
}

void NoteUnreadInput() {
  struct stat status = {};
  if (fstat(STDIN_FILENO, &status) != 0) return;
  bool hasBytes = false;
  if (S_ISREG(status.st_mode)) {
    hasBytes = lseek(STDIN_FILENO, 0, SEEK_CUR) < status.st_size;
  } else if (S_ISFIFO(status.st_mode) || S_ISSOCK(status.st_mode)) {
    int count = 0;
    hasBytes = ioctl(STDIN_FILENO, FIONREAD, &count) == 0 && count > 0;
  }
  if (hasBytes) Note("standard input", "was not read; give - as the file to read it");
}

WholeInput ReadInput(const std::string &file, uint64_t limit) {
  Input input(file);
  WholeInput whole;
  std::string &bytes = whole.bytes;
  while (bytes.size() <= limit) {
    const size_t size = bytes.size();
    bytes.resize(size + kBlockSize);
    const std::optional<size_t> count = input.Read(bytes.data() + size, kBlockSize);
    bytes.resize(size + count.value_or(0));
    if (!count) whole.status = kUnreadable;
    if (count.value_or(0) == 0) return whole;
  }
  bytes.resize(limit);
  input.ComplainOf(fleet::TooLarge(limit));
  whole.status = kUnreadable;
  return whole;
}

}  // namespace tools
