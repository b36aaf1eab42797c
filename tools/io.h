// Input, output and complaints of the morwick command.
#ifndef TOOLS_IO_H
#define TOOLS_IO_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tools {

enum Status {
  kGood = 0,
  kBadData = 1,   // no controller; data that is bad or incomplete; output that cannot be written
  kBadUsage = 2,  // wrong usage; input that cannot be read
};

// One line on standard error.
void Complain(const std::string &subject, const std::string &reason);

// What a file is called in messages; "-" is standard input.
std::string DisplayName(const std::string &file);

// Reads a whole file, or standard input for "-". Shows progress on a terminal when it takes longer
// than a second. Without a value it has complained: the input cannot be read or is larger than
// `limit` bytes.
std::optional<std::string> ReadInput(const std::string &file, uint64_t limit = UINT64_MAX);

// Standard output, checked: nothing is cut silently.
class Output {
 public:
  // False when writing has failed; there is no point in going on then.
  bool Write(std::string_view text);

  // Writes out what is buffered. Complains and turns `status` into kBadData when anything failed.
  Status Finish(Status status);

 private:
  int error_ = 0;
};

}  // namespace tools

#endif
