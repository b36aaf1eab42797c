// File descriptors.
#ifndef FLEET_DESCRIPTOR_H
#define FLEET_DESCRIPTOR_H

#include <unistd.h>

#include <string_view>
#include <utility>

namespace fleet {

// Owns a descriptor, and closes it at the end.
class Descriptor {
 public:
  // `number` is the result of open(2), which is negative when it failed.
  explicit Descriptor(int number = -1) : number_(number) {}
  Descriptor(Descriptor &&other) noexcept : number_(std::exchange(other.number_, -1)) {}
  Descriptor &operator=(Descriptor &&other) noexcept {
    std::swap(number_, other.number_);
    return *this;
  }
  ~Descriptor() { Close(); }

  bool isOpen() const { return number_ >= 0; }
  int number() const { return number_; }

  // Returns the result of close, or 0 when nothing is open.
  int Close() { return number_ < 0 ? 0 : close(std::exchange(number_, -1)); }

 private:
  int number_;
};

// Called right after a read (POLLIN) or a write (POLLOUT) has failed, as it looks at errno. Waits
// until a non-blocking descriptor is ready. False when trying again would not help.
bool CanTryAgain(int descriptor, short events);

// Writes all bytes and waits when it must. Returns 0, or the error number as in errno.
int WriteAll(int descriptor, std::string_view bytes);

}  // namespace fleet

#endif
