// A file descriptor that is closed when its owner goes.
#ifndef TOOLS_DESCRIPTOR_H
#define TOOLS_DESCRIPTOR_H

#include <unistd.h>

#include <utility>

namespace tools {

class Descriptor {
 public:
  // What open returned: negative when it failed.
  explicit Descriptor(int number = -1) : number_(number) {}
  Descriptor(Descriptor &&other) noexcept : number_(std::exchange(other.number_, -1)) {}
  Descriptor &operator=(Descriptor &&other) noexcept {
    std::swap(number_, other.number_);
    return *this;
  }
  ~Descriptor() { Close(); }

  bool open() const { return number_ >= 0; }
  int number() const { return number_; }

  // The result of close.
  int Close() { return number_ < 0 ? 0 : close(std::exchange(number_, -1)); }

 private:
  int number_;
};

}  // namespace tools

#endif
