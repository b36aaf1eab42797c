#include "platform/simulated/files.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <unistd.h>

#include <cstdio>

namespace simulated {

int ReadFile(const std::string &path, size_t most, std::string *bytes) {
  bytes->resize(most);  // before the file is open: if memory is refused, it stays closed
  const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (file < 0) return errno;
  size_t size = 0;
  ssize_t got = 0;
  do {
    got = read(file, bytes->data() + size, most - size);
    if (got > 0) size += static_cast<size_t>(got);
  } while (got > 0 && size < most);
  const int error = got < 0 ? errno : 0;  // a directory opens but cannot be read
  close(file);
  bytes->resize(size);
  return error;
}

std::string Printable(std::string_view text) {
  std::string printable;
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte >= ' ' && byte <= '~') {
      printable += c;
    } else {
      constexpr char kDigits[] = "0123456789abcdef";
      printable.append("\\x").append(1, kDigits[byte >> 4]).append(1, kDigits[byte & 15]);
    }
  }
  return printable;
}

std::string Quoted(std::string_view text) { return "'" + Printable(text) + "'"; }

void Complain(const std::string &reason) {
  pollfd writable = {.fd = STDERR_FILENO, .events = POLLOUT, .revents = 0};
  if (poll(&writable, 1, 1000) == 0) return;
  std::fprintf(stderr, "%s: %s\n", program_invocation_short_name, reason.c_str());
}

}  // namespace simulated
