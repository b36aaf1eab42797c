// Input, output and complaints of the morwick command.

#include "tools/io.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <climits>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <filesystem>

#include "tools/text.h"

namespace tools {
namespace {

constexpr size_t kBlockSize = 64 << 10;
constexpr rlim_t kMemoryLimit = 1 << 30;
constexpr int kMostLinks = 40;  // the kernel's own limit

int outputDescriptor = STDOUT_FILENO;
std::vector<Message> messages;

// True when it is worth trying again what failed with errno.
bool CanTryAgain(int descriptor, short events) {
  if (errno == EINTR) return true;
  if (errno != EAGAIN && errno != EWOULDBLOCK) return false;
  pollfd wait = {descriptor, events, 0};  // somebody made it non-blocking
  return poll(&wait, 1, -1) > 0 || errno == EINTR;
}

// Writes everything, or returns what went wrong.
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

void Say(const char *severity, const std::string &subject, const std::string &reason) {
  messages.push_back({severity, subject + ": " + reason});
  PrintLine(messages.back().text);
}

// Writes beside a file what then takes its place, or returns what went wrong.
int Replace(const std::string &file, std::string_view bytes, std::optional<mode_t> mode) {
  std::string beside = file + ".XXXXXX";
  const int descriptor = mkostemp(beside.data(), O_CLOEXEC);
  if (descriptor < 0) return errno;
  const mode_t mask = umask(0);
  umask(mask);
  int error = WriteAll(descriptor, bytes);
  if (error == 0 && fchmod(descriptor, mode.value_or(0666 & ~mask)) != 0) error = errno;
  if (error == 0 && fsync(descriptor) != 0) error = errno;
  if (close(descriptor) != 0 && error == 0) error = errno;
  if (error == 0 && rename(beside.c_str(), file.c_str()) != 0) error = errno;
  if (error != 0) unlink(beside.c_str());
  return error;
}

// The descriptor of this process that a link such as /proc/self/fd/1 stands for: what it leads to
// is to be written through it, and not replaced.
std::optional<int> OwnDescriptor(const std::filesystem::path &link) {
  std::error_code failure;
  if (!equivalent(link.parent_path(), "/proc/self/fd", failure)) return std::nullopt;
  const std::optional<uint64_t> number = ParseNumber(link.filename().native(), INT_MAX);
  if (!number) return std::nullopt;
  if (*number == STDOUT_FILENO) return outputDescriptor;
  const auto own = static_cast<int>(*number);
  return own == outputDescriptor ? -1 : own;  // nobody else knows that one: it was not open
}

int64_t MillisecondsNow() {
  using std::chrono::steady_clock;
  return std::chrono::duration_cast<std::chrono::milliseconds>(
             steady_clock::now().time_since_epoch())
      .count();
}

}  // namespace

void PrepareStreams() {
  // Reading only: a write to a stream that was closed still fails.
  int descriptor = 0;
  do {
    descriptor = open("/dev/null", O_RDONLY);
  } while (descriptor >= 0 && descriptor <= STDERR_FILENO);
  if (descriptor >= 0) close(descriptor);

  outputDescriptor = fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
  dup2(STDERR_FILENO, STDOUT_FILENO);
  std::setvbuf(stdout, nullptr, _IONBF, 0);
  std::signal(SIGPIPE, SIG_IGN);
}

void LimitMemory() {
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)  // these need all there is
  rlimit limit = {};
  if (getrlimit(RLIMIT_AS, &limit) != 0 || limit.rlim_cur <= kMemoryLimit) return;
  limit.rlim_cur = kMemoryLimit;
  setrlimit(RLIMIT_AS, &limit);
#endif
}

void PrintLine(const std::string &text) {
  const bool terminal = isatty(STDERR_FILENO) != 0;
  std::fprintf(stderr, "morwick: %s\n", terminal ? Printable(text).c_str() : text.c_str());
}

void Complain(const std::string &subject, const std::string &reason) {
  Say("error", subject, reason);
}

void Note(const std::string &subject, const std::string &reason) { Say("note", subject, reason); }

const std::vector<Message> &Messages() { return messages; }

void ForgetMessages() { messages.clear(); }

std::string DisplayName(const std::string &file) {
  if (file.empty()) return "''";
  return file == "-" ? "standard input" : file;
}

Input::Input(const std::string &file, bool showProgress)
    : name_(DisplayName(file)),
      descriptor_(file == "-" ? STDIN_FILENO : open(file.c_str(), O_RDONLY | O_CLOEXEC)) {
  if (descriptor_ < 0) error_ = errno;
  if (showProgress && isatty(STDERR_FILENO) != 0) nextProgress_ = MillisecondsNow() + 1000;
  struct stat status = {};
  if (fstat(descriptor_, &status) == 0 && S_ISREG(status.st_mode)) {
    size_ = static_cast<uint64_t>(status.st_size);
  }
}

Input::~Input() {
  ClearProgress();
  if (descriptor_ > STDIN_FILENO) close(descriptor_);
}

std::optional<size_t> Input::Read(char *bytes, size_t room) {
  while (error_ == 0) {
    const ssize_t count = read(descriptor_, bytes, room);
    if (count >= 0) {
      read_ += static_cast<size_t>(count);
      ShowProgress();
      return static_cast<size_t>(count);
    }
    if (!CanTryAgain(descriptor_, POLLIN)) error_ = errno;
  }
  Refuse(std::strerror(error_));
  return std::nullopt;
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
  std::fprintf(stderr, "\rmorwick: %s: %llu%s KiB read", Printable(name_).c_str(),
               static_cast<unsigned long long>(read_ >> 10), total.c_str());
}

void Input::ClearProgress() {
  if (progressShown_) std::fputs("\r\033[K", stderr);
  progressShown_ = false;
}

std::optional<std::string> ReadInput(const std::string &file, uint64_t limit) {
  Input input(file);
  std::string bytes;
  for (uint64_t length = input.size(); length <= limit; length = bytes.size()) {
    const size_t size = bytes.size();
    bytes.resize(size + kBlockSize);
    const std::optional<size_t> count = input.Read(bytes.data() + size, kBlockSize);
    if (!count) return std::nullopt;
    bytes.resize(size + *count);
    if (*count == 0) return bytes;
  }
  input.Refuse("larger than " + std::to_string(limit) + " bytes");
  return std::nullopt;
}

bool WriteFile(const std::string &file, std::string_view bytes, std::optional<mode_t> mode) {
  const auto end = [&](int error) {
    if (error != 0) Complain(file, std::strerror(error));
    return error == 0;
  };
  // A link stays a link, and what it leads to is made.
  std::error_code failure;
  std::filesystem::path target = file;
  for (int links = 0; is_symlink(target, failure); ++links) {
    if (links == kMostLinks) return end(ELOOP);
    if (const std::optional<int> own = OwnDescriptor(target)) return end(WriteAll(*own, bytes));
    target = target.parent_path() / read_symlink(target, failure);
  }
  const auto type = std::filesystem::status(target, failure).type();
  if (type != std::filesystem::file_type::regular &&
      type != std::filesystem::file_type::not_found) {
    const int descriptor = open(file.c_str(), O_WRONLY | O_CLOEXEC);
    if (descriptor < 0) return end(errno);
    const int error = WriteAll(descriptor, bytes);
    close(descriptor);
    return end(error);
  }

  // A signal waits meanwhile: if it ends the command, nothing is left beside the file.
  sigset_t all, before;
  sigfillset(&all);
  sigprocmask(SIG_BLOCK, &all, &before);
  const int error = Replace(target, bytes, mode);
  sigprocmask(SIG_SETMASK, &before, nullptr);
  return end(error);
}

Output::Output() : terminal_(OutputIsTerminal()) {}

bool Output::Flush() {
  const size_t length = length_;
  length_ = 0;
  return WriteOut({buffer_, length});
}

bool Output::WaitWithReader(const timespec &time, const sigset_t &mask) {
  pollfd reader = {outputDescriptor, 0, 0};  // an error is reported unasked
  if (ppoll(&reader, 1, &time, &mask) > 0) error_ = EPIPE;
  return error_ == 0;
}

bool Output::WriteRoundTheBuffer(std::string_view text) {
  return Flush() && (text.size() > kRoom ? WriteOut(text) : Write(text));
}

bool Output::WriteOut(std::string_view bytes) {
  if (error_ != 0) return false;
  error_ =
      terminal_ ? WriteAll(outputDescriptor, Printable(bytes)) : WriteAll(outputDescriptor, bytes);
  return error_ == 0;
}

Status Output::Finish(Status status) {
  if (Flush()) return status;
  if (error_ == EPIPE) {
    std::signal(SIGPIPE, SIG_DFL);
    std::raise(SIGPIPE);
  }
  Complain("standard output", std::strerror(error_));
  return kBadData;
}

bool OutputIsTerminal() { return isatty(outputDescriptor) != 0; }

}  // namespace tools
