// Writes text into a caller's buffer, piece by piece. A piece fits when its NUL fits too. After a
// piece that did not fit, no other piece fits.
#ifndef STATS_BOUNDED_WRITER_H
#define STATS_BOUNDED_WRITER_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

namespace morwick {

class BoundedWriter {
 public:
  BoundedWriter(char *output, uint64_t capacity)
      : start_(output), position_(output), free_(capacity) {}

  uint64_t length() const { return static_cast<uint64_t>(position_ - start_); }

  // Appends the piece. When it does not fit, appends the part that fits and a NUL, and returns
  // false.
  bool Append(std::string_view piece) {
    if (Fits(piece.size())) {
      piece.copy(position_, piece.size());
      return Advance(piece.size());
    }
    if (free_ > 0) {
      piece.copy(position_, free_ - 1);
      position_[free_ - 1] = '\0';
    }
    return Fail();
  }

  // Appends the first characters of an array. When there is room the whole array is copied: for a
  // few characters this is faster than a copy of their exact number.
  template <size_t kRoom>
  bool AppendFirst(const char (&characters)[kRoom], size_t length) {
    if (!Fits(kRoom)) return Append(std::string_view(characters, length));
    std::memcpy(position_, characters, kRoom);
    return Advance(length);
  }

  // Appends the text that `write` writes. `write` gets room for kRoom characters and returns the
  // end of its text.
  template <size_t kRoom, typename Write>
  bool AppendWritten(Write write) {
    if (Fits(kRoom)) {  // nearly always; it saves a copy
      return Advance(static_cast<size_t>(write(position_) - position_));
    }
    char text[kRoom];
    return Append(std::string_view(text, write(text)));
  }

  // Appends the text that `print` prints, given the room and its size. `print` returns as snprintf.
  template <typename Print>
  bool AppendPrinted(Print print) {
    const int length = print(position_, free_);
    if (length < 0 || !Fits(static_cast<uint64_t>(length))) return Fail();
    return Advance(static_cast<size_t>(length));
  }

  // Ends the text at this length, at most the present one. The capacity must not be 0.
  void EndAt(uint64_t length) { start_[length] = '\0'; }

 private:
  bool Fits(uint64_t length) const { return free_ > length; }

  bool Advance(size_t length) {
    position_ += length;
    free_ -= length;
    return true;
  }

  bool Fail() {
    free_ = 0;
    return false;
  }

  char *start_;
  char *position_;
  uint64_t free_;  // with the byte for the NUL
};

}  // namespace morwick

#endif
