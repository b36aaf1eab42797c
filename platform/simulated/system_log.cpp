// The system log. Lines go to the system's log socket, and to standard error for a person who runs
// the process in the foreground. No function here waits for a reader.

#include <fcntl.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <mutex>

#include "morwick/platform.h"
#include "platform/simulated/process.h"

namespace simulated {
namespace {

constexpr size_t kLongestMessage = 1024;
using Line = std::array<char, kLongestMessage + 64>;  // with room for time, program and level

// Where lines go. A line that cannot be written at once waits in a bounded space. Lines that do not
// fit there, and lines whose write fails, are dropped and counted.
class Output {
 public:
  // Makes a line of a message; returns its length.
  using Format = int(const char *message, Line *line);
  // Returns how much was written, 0 when there is no room now, or -1 when the write fails.
  using Write = ssize_t(int descriptor, const char *text, size_t length);

  Output(int descriptor, Format *format, Write *write)
      : descriptor_(descriptor), format_(format), write_(write) {}

  void Add(const char *message) {
    Flush();
    if (dropped_ > 0 || !Put(message)) ++dropped_;
  }

  // Writes the lines that wait. True when none is left.
  bool Flush() {
    while (waitingSize_ > 0) {
      const size_t length = std::strlen(waiting_.data());
      const ssize_t written = write_(descriptor_, waiting_.data(), length);
      if (written == 0) return false;
      // The line is lost. If it reported lost lines, those count again.
      if (written < 0) dropped_ += std::max(reported_, 1ULL);
      // The rest of a line that was written in part keeps waiting.
      const bool done = written < 0 || static_cast<size_t>(written) == length;
      const size_t gone = done ? length + 1 : static_cast<size_t>(written);
      waitingSize_ -= gone;
      std::memmove(waiting_.data(), waiting_.data() + gone, waitingSize_);
      if (done) reported_ = 0;
    }
    if (dropped_ > 0) {
      std::array<char, 64> message;
      std::snprintf(message.data(), message.size(), "%llu lines of the log were dropped", dropped_);
      if (Put(message.data())) {
        if (waitingSize_ > 0) reported_ = dropped_;
        dropped_ = 0;
      }
    }
    return waitingSize_ == 0;
  }

 private:
  // Writes the message as a line, or lets it wait. False when it is lost.
  bool Put(const char *message) {
    Line line;
    const auto length = static_cast<size_t>(format_(message, &line));
    const ssize_t written = waitingSize_ > 0 ? 0 : write_(descriptor_, line.data(), length);
    if (written < 0) return false;
    const size_t left = length - static_cast<size_t>(written);
    if (left == 0) return true;
    if (left >= waiting_.size() - waitingSize_) return false;
    std::copy_n(line.data() + written, left + 1, waiting_.data() + waitingSize_);
    waitingSize_ += left + 1;
    return true;
  }

  const int descriptor_;
  Format *const format_;
  Write *const write_;
  std::array<char, 16 << 10> waiting_ = {};  // lines, each with its NUL
  size_t waitingSize_ = 0;
  unsigned long long dropped_ = 0;
  unsigned long long reported_ = 0;  // dropped lines that the first waiting line reports
};

int FormatForTheSystem(const char *message, Line *line) {
  const time_t now = std::time(nullptr);
  tm local = {};
  localtime_r(&now, &local);
  std::array<char, 32> stamp;
  std::strftime(stamp.data(), stamp.size(), "%b %e %T", &local);
  return std::snprintf(line->data(), line->size(), "<%d>%s grellon[%d]: %s",
                       LOG_DAEMON | LOG_NOTICE, stamp.data(), getpid(), message);
}

// The socket stays unconnected, so that lines reach a log that was restarted.
ssize_t SendToTheSystem(int socket, const char *text, size_t length) {
  static constexpr sockaddr_un kReader = {.sun_family = AF_UNIX, .sun_path = "/dev/log"};
  const ssize_t written = sendto(socket, text, length, MSG_DONTWAIT | MSG_NOSIGNAL,
                                 reinterpret_cast<const sockaddr *>(&kReader), sizeof kReader);
  return written < 0 && errno == EAGAIN ? 0 : written;
}

int FormatForAPerson(const char *message, Line *line) {
  return std::snprintf(line->data(), line->size(), "grellon: %s\n", message);
}

ssize_t WriteToAPerson(int descriptor, const char *text, size_t length) {
  ssize_t written = send(descriptor, text, length, MSG_DONTWAIT | MSG_NOSIGNAL);
  if (written < 0 && errno == ENOTSOCK) {
    pollfd writable = {.fd = descriptor, .events = POLLOUT, .revents = 0};
    if (poll(&writable, 1, 0) == 0) return 0;
    written = write(descriptor, text, length);
  }
  return written < 0 && errno == EAGAIN ? 0 : written;
}

// A pipe or a terminal that others write to can be full again between poll and write. So it is
// opened a second time, with O_NONBLOCK. The flag may not be set on the shared descriptor, because
// the others may want to wait.
int OpenStandardError() {
  struct stat stream = {};
  if (fstat(STDERR_FILENO, &stream) == 0 &&
      (S_ISFIFO(stream.st_mode) || isatty(STDERR_FILENO) != 0)) {
    const int own = open("/proc/self/fd/2", O_WRONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
    if (own >= 0) return own;
  }
  return STDERR_FILENO;
}

// JOURNAL_STREAM names the stream that the journal reads. A line written there would be logged
// twice.
bool StandardErrorIsTheJournal() {
  const char *journal = std::getenv("JOURNAL_STREAM");
  struct stat stream = {};
  if (journal == nullptr || fstat(STDERR_FILENO, &stream) != 0) return false;
  std::array<char, 64> name;
  std::snprintf(name.data(), name.size(), "%llu:%llu",
                static_cast<unsigned long long>(stream.st_dev),
                static_cast<unsigned long long>(stream.st_ino));
  return std::strcmp(name.data(), journal) == 0;
}

class Log {
 public:
  explicit Log(bool enabled) : enabled_(enabled) {}

  // Gives lines that still wait a second.
  ~Log() {
    for (int tries = 100; tries > 0 && !Flush(); --tries) usleep(10'000);
  }

  bool enabled() const { return enabled_; }

  void Add(const char *message) {
    const std::lock_guard lock(mutex_);
    system_.Add(message);
    if (foreground_) person_.Add(message);
  }

 private:
  bool Flush() {
    const bool systemDone = system_.Flush();
    return person_.Flush() && systemDone;
  }

  const bool enabled_;
  const bool foreground_ = !StandardErrorIsTheJournal();
  std::mutex mutex_;
  Output system_{socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0), FormatForTheSystem,
                 SendToTheSystem};
  Output person_{OpenStandardError(), FormatForAPerson, WriteToAPerson};
};

}  // namespace
}  // namespace simulated

void SystemLog(const char *format, ...) {
  static simulated::Log log(simulated::TakeProcess().logEnabled);
  if (!log.enabled()) return;
  std::array<char, simulated::kLongestMessage> message;
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message.data(), message.size(), format, arguments);
  va_end(arguments);
  // Some messages end their line themselves.
  if (const size_t length = std::strlen(message.data());
      length > 0 && message[length - 1] == '\n') {
    message[length - 1] = '\0';
  }
  log.Add(message.data());
}
