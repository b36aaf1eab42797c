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

// In bytes. No controller gives more; larger dumps are refused. Compressed ones count unpacked.
constexpr uint64_t kLargestDump = 16 << 20;

// "larger than 16777216 bytes".
std::string TooLarge(uint64_t limit);

// Reads dump after dump. Each thread needs a reader of its own.
class DumpReader {
 public:
  struct Dump {
    std::string_view bytes;  // valid until the next call
    std::string fault;       // why they are not the whole file; empty when they are
  };
  // Reads the file with that name; "-" is standard input. With `onlyFiles` everything but a regular
  // file is refused without opening it.
  Dump Read(const char *name, bool onlyFiles);

 private:
  void Grow();

  std::unique_ptr<char, void (*)(void *)> buffer_{nullptr, std::free};
  size_t capacity_ = 0;
};

}  // namespace fleet

#endif
