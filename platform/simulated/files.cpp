// Reads files from outside and complains about them.

#include "platform/simulated/files.h"

#include <errno.h>

#include <cctype>
#include <cstdio>
#include <memory>

namespace simulated {

int ReadFile(const char *path, void *bytes, size_t room, size_t *size) {
  const std::unique_ptr<FILE, int (*)(FILE *)> file(std::fopen(path, "rb"), std::fclose);
  if (file == nullptr) return errno;
  std::setvbuf(file.get(), nullptr, _IONBF, 0);  // a buffer would be filled beyond the room
  *size = std::fread(bytes, 1, room, file.get());
  // A directory opens but cannot be read.
  return std::ferror(file.get()) == 0 ? 0 : errno;
}

std::string Quoted(std::string_view text) {
  std::string quoted = "'";
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    if (std::iscntrl(byte) == 0) {
      quoted += c;
    } else {
      constexpr char kDigits[] = "0123456789abcdef";
      quoted.append("\\x").append(1, kDigits[byte >> 4]).append(1, kDigits[byte & 15]);
    }
  }
  return quoted + "'";
}

void Complain(const std::string &reason) {
  std::fprintf(stderr, "%s: %s\n", program_invocation_short_name, reason.c_str());
}

}  // namespace simulated
