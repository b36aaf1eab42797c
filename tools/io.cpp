// Input and output of the morwick command.

#include "tools/io.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <utility>

#include "fleet/dump.h"
#include "tools/text.h"

namespace tools {
namespace {

constexpr size_t kBlockSize = 64 << 10;

int outputDescriptor = STDOUT_FILENO;

// True when it is worth trying again what failed with errno.
bool CanTryAgain(int descriptor, short events) {
  if (errno == EINTR) return true;
  if (errno != EAGAIN && errno != EWOULDBLOCK) return false;
  pollfd wait = {descriptor, events, 0};  // somebody made it non-blocking
  return poll(&wait, 1, -1) > 0 || errno == EINTR;
}

int64_t MillisecondsNow() {
  using std::chrono::steady_clock;
  return std::chrono::duration_cast<std::chrono::milliseconds>(
             steady_clock::now().time_since_epoch())
      .count();
}

}  // namespace

void PrepareStreams() {
  // Reading only: a write to a stream that was closed still fails. Where there is no /dev/null the
  // root folder does.
  int descriptor = 0;
  do {
    descriptor = open("/dev/null", O_RDONLY);
    if (descriptor < 0) descriptor = open("/", O_RDONLY);
  } while (descriptor >= 0 && descriptor <= STDERR_FILENO);
  if (descriptor >= 0) close(descriptor);

  outputDescriptor = fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
  dup2(STDERR_FILENO, STDOUT_FILENO);
  std::setvbuf(stdout, nullptr, _IONBF, 0);
  std::signal(SIGPIPE, SIG_IGN);
}

int WriteAll(int descriptor, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t count = write(descriptor, bytes.data(), bytes.size());
    if (count >= 0) {
      bytes.remove_prefix(static_cast<size_t>(count));
    } else if (!CanTryAgain(descriptor, POLLOUT)) {
      return errno;
    }
  }
  return 0;
}

int OriginalDescriptor(int number) {
  if (number == STDOUT_FILENO) return outputDescriptor;
  return number == outputDescriptor ? -1 : number;
}

std::string DisplayName(const std::string &file) {
  if (file.empty()) return "''";
  return file == "-" ? "standard input" : file;
}

Input::Input(const std::string &file, bool showProgress)
    : name_(DisplayName(file)),
      file_(file == "-" ? -1 : open(file.c_str(), O_RDONLY | O_CLOEXEC)),
      descriptor_(file == "-" ? STDIN_FILENO : file_.number()) {
  if (descriptor_ < 0) error_ = errno;
  if (showProgress && isatty(STDERR_FILENO) != 0) nextProgress_ = MillisecondsNow() + 1000;
  struct stat status = {};
  if (fstat(descriptor_, &status) == 0 && S_ISREG(status.st_mode)) {
    size_ = static_cast<uint64_t>(status.st_size);
  }
}

std::optional<size_t> Input::Read(char *bytes, size_t room) {
  fleet::ReadResult result = reader_.Read(bytes, room);
  if (result.fault.empty()) return result.count;
  Refuse(result.fault);
  return std::nullopt;
}

fleet::ReadResult Input::ReadRaw(char *bytes, size_t room) {
  while (error_ == 0) {
    const ssize_t count = read(descriptor_, bytes, room);
    if (count >= 0) {
      read_ += static_cast<size_t>(count);
      ShowProgress();
      return {static_cast<size_t>(count), ""};
    }
    if (!CanTryAgain(descriptor_, POLLIN)) error_ = errno;
  }
  return {0, std::strerror(error_)};
}

void Input::Refuse(const std::string &reason) {
  ClearProgress();
  Complain(name_, reason);
}

// A line on the terminal that is written over again and again.
void Input::ShowProgress() {
  if (nextProgress_ == INT64_MAX || MillisecondsNow() < nextProgress_) return;
  nextProgress_ = MillisecondsNow() + 200;
  progressShown_ = true;
  const std::string total = size_ == 0 ? "" : " of " + std::to_string(size_ >> 10);
  std::fprintf(stderr, "\rmorwick: %s: %llu%s KiB read", PrintableLine(name_).c_str(),
               static_cast<unsigned long long>(read_ >> 10), total.c_str());
}

void Input::ClearProgress() {
  if (progressShown_) std::fputs("\r\033[K", stderr);
  progressShown_ = false;
}

void NoteUnreadInput() {
  struct stat status = {};
  if (fstat(STDIN_FILENO, &status) != 0) return;
  bool isReady = false;
  if (S_ISREG(status.st_mode)) {
    isReady = lseek(STDIN_FILENO, 0, SEEK_CUR) < status.st_size;
  } else if (S_ISFIFO(status.st_mode) || S_ISSOCK(status.st_mode)) {
    int count = 0;
    isReady = ioctl(STDIN_FILENO, FIONREAD, &count) == 0 && count > 0;
  }
  if (isReady) Note("standard input", "was not read; name it, as -, to read it");
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
    if (!count) whole.status = kBadUsage;
    if (count.value_or(0) == 0) return whole;
  }
  bytes.resize(limit);
  input.Refuse(fleet::TooLarge(limit));
  whole.status = kBadUsage;
  return whole;
}

Output::Output() : terminal_(OutputIsTerminal()) {}

bool Output::Flush() {
  const std::string_view text(buffer_, length_);
  const size_t whole = length_ - (terminal_ ? IncompleteEnd(text) : 0);
  WriteOut(text.substr(0, whole));
  length_ -= whole;
  std::memmove(buffer_, buffer_ + whole, length_);
  return error_ == 0;
}

void Output::Control(std::string_view sequence) {
  if (Flush()) error_ = WriteAll(outputDescriptor, sequence);
}

Output::Size Output::Window() {
  winsize size = {};
  if (ioctl(outputDescriptor, TIOCGWINSZ, &size) != 0 || size.ws_row * size.ws_col == 0)
    size = {24, 80, 0, 0};
  return {std::max<size_t>(size.ws_row, 2), std::max<size_t>(size.ws_col, 1)};
}

bool Output::WaitWithReader(const timespec &time, const sigset_t &mask) {
  pollfd reader = {outputDescriptor, 0, 0};  // an error is reported unasked
  if (ppoll(&reader, 1, &time, &mask) > 0) error_ = EPIPE;
  return error_ == 0;
}

bool Output::WriteOut(std::string_view bytes) {
  if (error_ == 0) {
    error_ = WriteAll(outputDescriptor, terminal_ ? PrintableText(bytes) : bytes);
  }
  return error_ == 0;
}

Status Output::Finish(Status status) {
  if (Flush() && WriteOut({buffer_, std::exchange(length_, 0)})) return status;
  if (error_ == EPIPE) {
    std::signal(SIGPIPE, SIG_DFL);
    std::raise(SIGPIPE);
  }
  Complain("standard output", std::strerror(error_));
  return kBadData;
}

bool OutputIsTerminal() { return isatty(outputDescriptor) != 0; }

}  // namespace tools
