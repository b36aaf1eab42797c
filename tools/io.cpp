// Input, output and complaints of the morwick command.

#include "tools/io.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstring>

namespace tools {
namespace {

constexpr size_t kBlockSize = 1 << 20;

// Closes what it opened, and not standard input.
class InputFile {
 public:
  explicit InputFile(const std::string &file)
      : descriptor_(file == "-" ? STDIN_FILENO : open(file.c_str(), O_RDONLY | O_CLOEXEC)) {}
  ~InputFile() {
    if (descriptor_ > STDIN_FILENO) close(descriptor_);
  }
  InputFile(const InputFile &) = delete;
  InputFile &operator=(const InputFile &) = delete;

  int descriptor() const { return descriptor_; }

  // Of a regular file; 0 where it cannot be known.
  uint64_t Size() const {
    struct stat status = {};
    const bool regular = fstat(descriptor_, &status) == 0 && S_ISREG(status.st_mode);
    return regular ? static_cast<uint64_t>(status.st_size) : 0;
  }

 private:
  int descriptor_;
};

// A line on the terminal that is written over again and again, from the first second on.
class Progress {
 public:
  Progress(const std::string &file, uint64_t size) : name_(DisplayName(file)), size_(size) {}
  ~Progress() {
    if (shown_) std::fputs("\r\033[K", stderr);
  }
  Progress(const Progress &) = delete;
  Progress &operator=(const Progress &) = delete;

  void Show(uint64_t read) {
    const auto now = std::chrono::steady_clock::now();
    if (now < next_ || !terminal_) return;
    next_ = now + std::chrono::milliseconds(200);
    shown_ = true;
    const std::string total = size_ == 0 ? "" : " of " + std::to_string(size_ >> 10);
    std::fprintf(stderr, "\rmorwick: %s: %llu%s KiB read", name_.c_str(),
                 static_cast<unsigned long long>(read >> 10), total.c_str());
  }

 private:
  std::string name_;
  uint64_t size_;
  bool terminal_ = isatty(STDERR_FILENO) != 0;
  bool shown_ = false;
  std::chrono::steady_clock::time_point next_ =
      std::chrono::steady_clock::now() + std::chrono::seconds(1);
};

}  // namespace

void Complain(const std::string &subject, const std::string &reason) {
  std::fprintf(stderr, "morwick: %s: %s\n", subject.c_str(), reason.c_str());
}

std::string DisplayName(const std::string &file) { return file == "-" ? "standard input" : file; }

std::optional<std::string> ReadInput(const std::string &file, uint64_t limit) {
  const InputFile input(file);
  const auto fail = [&](const std::string &reason) {
    Complain(DisplayName(file), reason);
    return std::nullopt;
  };
  const std::string tooLarge = "larger than " + std::to_string(limit) + " bytes";
  if (input.descriptor() < 0) return fail(std::strerror(errno));
  if (input.Size() > limit) return fail(tooLarge);

  std::string bytes;
  ssize_t count = 1;
  std::optional<int> error;
  {
    Progress progress(file, input.Size());
    while (count > 0 && bytes.size() <= limit) {
      const size_t size = bytes.size();
      bytes.resize(size + kBlockSize);
      do {
        count = read(input.descriptor(), bytes.data() + size, kBlockSize);
      } while (count < 0 && errno == EINTR);
      if (count < 0) error = errno;
      bytes.resize(size + static_cast<size_t>(count > 0 ? count : 0));
      progress.Show(bytes.size());
    }
  }
  if (error) return fail(std::strerror(*error));
  if (bytes.size() > limit) return fail(tooLarge);
  return bytes;
}

bool Output::Write(std::string_view text) {
  if (error_ == 0 && std::fwrite(text.data(), 1, text.size(), stdout) != text.size())
    error_ = errno;
  return error_ == 0;
}

Status Output::Finish(Status status) {
  if (std::fflush(stdout) != 0 && error_ == 0) error_ = errno;
  if (error_ == 0) return status;
  Complain("standard output", std::strerror(error_));
  return kBadData;
}

}  // namespace tools
