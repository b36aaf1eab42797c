// Dumps as files, one after the other into the same memory.
#ifndef FLEET_DUMP_H
#define FLEET_DUMP_H

#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>

#include "fleet/gzip.h"

namespace fleet {

// Larger dumps are refused. The size of a compressed dump is that of its content.
constexpr uint64_t kLargestDump = 16 << 20;

// "larger than 16777216 bytes".
std::string TooLarge(uint64_t limit);

// Reads dump after dump. One for each thread.
class DumpReader {
 public:
  // Reads the file with that name; "-" is standard input. The bytes stay until the next call. When
  // they are not the whole file, `fault` says why. With `onlyFiles` everything but a regular file
  // is refused without opening it.
  struct Dump {
    std::string_view bytes;
    std::string fault;
  };
  Dump Read(const char *name, bool onlyFiles);

 private:
  void Grow();

  std::unique_ptr<char, void (*)(void *)> buffer_{nullptr, std::free};
  size_t capacity_ = 0;
};

}  // namespace fleet

#endif
