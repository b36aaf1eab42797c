#include "tools/output.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <utility>

#include "fleet/descriptor.h"
#include "tools/text.h"

namespace tools {
namespace {

int outputDescriptor = STDOUT_FILENO;

}  // namespace

void PrepareStreams() {
  // Opened for reading, so that a write to a stream that was closed still fails. Without /dev/null
  // the root folder takes its place.
  int descriptor = 0;
  do {
    descriptor = open("/dev/null", O_RDONLY);
    if (descriptor < 0) descriptor = open("/", O_RDONLY);
  } while (descriptor >= 0 && descriptor <= STDERR_FILENO);
  if (descriptor >= 0) close(descriptor);

  outputDescriptor = fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
  dup2(STDERR_FILENO, STDOUT_FILENO);
  std::setvbuf(stdout, nullptr, _IONBF, 0);  // its lines and messages stay in order
  std::signal(SIGPIPE, SIG_IGN);
}

int OriginalDescriptor(int number) {
  if (number == STDOUT_FILENO) return outputDescriptor;
  return number == outputDescriptor ? -1 : number;
}

bool OutputIsTerminal() { return isatty(outputDescriptor) != 0; }

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
  if (Flush()) error_ = fleet::WriteAll(outputDescriptor, sequence);
}

Output::Size Output::Window() {
  winsize size = {};
  if (ioctl(outputDescriptor, TIOCGWINSZ, &size) != 0 || size.ws_row * size.ws_col == 0)
    size = {24, 80, 0, 0};
  return {std::max<size_t>(size.ws_row, 2), std::max<size_t>(size.ws_col, 1)};
}

bool Output::WaitWithReader(const timespec &time, const sigset_t &mask) {
  pollfd reader = {outputDescriptor, 0, 0};  // POLLERR is reported unasked
  if (ppoll(&reader, 1, &time, &mask) > 0) error_ = EPIPE;
  return error_ == 0;
}

bool Output::WriteOut(std::string_view bytes) {
  if (error_ == 0) {
    error_ = fleet::WriteAll(outputDescriptor, terminal_ ? PrintableText(bytes) : bytes);
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

}  // namespace tools
