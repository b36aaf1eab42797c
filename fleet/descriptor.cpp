#include "fleet/descriptor.h"

#include <poll.h>

#include <cerrno>

namespace fleet {

bool CanTryAgain(int descriptor, short events) {
  if (errno == EINTR) return true;
  if (errno != EAGAIN && errno != EWOULDBLOCK) return false;
  pollfd wait = {descriptor, events, 0};  // another process made it non-blocking
  return poll(&wait, 1, -1) > 0 || errno == EINTR;
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

}  // namespace fleet
