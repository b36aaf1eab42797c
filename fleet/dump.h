// Dumps as files, one after the other into the same memory.
#ifndef FLEET_DUMP_H
#define FLEET_DUMP_H

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "fleet/gzip.h"

namespace fleet {

// Dumps above this are refused, by what they contain when it is unpacked.
constexpr uint64_t kLargestDump = 16 << 20;

// "larger than 16777216 bytes".
std::string TooLarge(uint64_t limit);

// Reads dump after dump. One for each thread.
class DumpReader {
 public:
  // The bytes of the file with that name, which stay until the next call, and why they are not all
  // of it, if so. A folder, and with `onlyFiles` what else is no regular file, is refused and not
  // waited for.
  struct Dump {
    std::string_view bytes;
    std::string fault;
  };
  Dump Read(const char *name, bool onlyFiles);

 private:
  char *Grow();

  std::unique_ptr<char[]> buffer_;
  size_t capacity_ = 0;
};

}  // namespace fleet

#endif
