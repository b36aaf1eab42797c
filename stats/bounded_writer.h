// Text into a caller's buffer, piece by piece. A piece fits when its NUL fits too.
#ifndef STATS_BOUNDED_WRITER_H
#define STATS_BOUNDED_WRITER_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "stats/decimal.h"

namespace morwick {

// A piece of a few characters that can be copied without asking how many.
struct ShortText {
  static constexpr size_t kRoom = 16;

  char characters[kRoom] = {};
  size_t length = 0;

  // There must be room.
  void Append(char character) { characters[length++] = character; }
};

class BoundedWriter {
 public:
  BoundedWriter(char *output, uint64_t capacity)
      : start_(output), position_(output), free_(capacity) {}

  uint64_t length() const { return static_cast<uint64_t>(position_ - start_); }

  // True while a piece of this length fits.
  bool Fits(uint64_t length) const { return free_ > length; }

  // Appends the piece. When it does not fit, as much of it as does, ended by a NUL, and returns
  // false.
  bool Append(std::string_view piece) {
    if (Fits(piece.size())) {
      piece.copy(position_, piece.size());
      Advance(piece.size());
      return true;
    }
    if (free_ > 0) {
      piece.copy(position_, free_ - 1);
      position_[free_ - 1] = '\0';
    }
    return false;
  }

  bool Append(const ShortText &piece) {
    if (!Fits(ShortText::kRoom)) return Append(std::string_view(piece.characters, piece.length));
    std::memcpy(position_, piece.characters, ShortText::kRoom);
    Advance(piece.length);
    return true;
  }

  // Appends the number as WritePadded does.
  bool AppendPadded(uint32_t value, uint32_t width, char pad) {
    if (Fits(kPaddedRoom)) {  // nearly always: no second copy
      Advance(static_cast<size_t>(WritePadded(position_, value, width, pad) - position_));
      return true;
    }
    char text[kPaddedRoom];
    return Append(std::string_view(text, WritePadded(text, value, width, pad)));
  }

  // Appends the character so many times; they must fit.
  void Fill(char character, size_t count) {
    std::memset(position_, character, count);
    Advance(count);
  }

  // Ends the text at this length, at most the present one. There must be a capacity.
  void EndAt(uint64_t length) { start_[length] = '\0'; }

 private:
  void Advance(size_t length) {
    position_ += length;
    free_ -= length;
  }

  char *start_;
  char *position_;
  uint64_t free_;  // the byte for the NUL included
};

}  // namespace morwick

#endif
