// What the morwick command reads: files and standard input.
#ifndef TOOLS_INPUT_H
#define TOOLS_INPUT_H

#include <cerrno>
#include <cstdint>
#include <optional>
#include <string>

#include "fleet/descriptor.h"
#include "fleet/gzip.h"
#include "tools/messages.h"

namespace tools {

// The name of a file in messages; "-" is standard input.
std::string DisplayName(const std::string &file);

// The bytes of a file, or of standard input for "-", in blocks as they arrive. Data that gzip has
// compressed is unpacked. After a second it shows progress on a terminal; without `showProgress` it
// does not, because the caller may already print there.
class Input {
 public:
  explicit Input(const std::string &file, bool showProgress = true);

  // The size of a regular file; 0 for everything else.
  uint64_t size() const { return size_; }

  // Reads up to `room` bytes, and returns their number; 0 at the end. Returns nothing after a
  // complaint.
  std::optional<size_t> Read(char *bytes, size_t room);

  void ComplainOf(const std::string &fault);

 private:
  fleet::ReadResult ReadRaw(char *bytes, size_t room);

  std::string name_;
  fleet::Descriptor file_;
  int descriptor_;                           // of the file, or standard input
  int error_ = descriptor_ < 0 ? errno : 0;  // errno of opening or reading
  uint64_t size_ = 0;
  uint64_t bytesRead_ = 0;
  ProgressLine progress_;
  fleet::GzipReader reader_{[this](char *bytes, size_t room) { return ReadRaw(bytes, room); }};
};

// Prints a note when standard input has bytes to read that no argument asked for. They may be meant
// for another program, so they are not read; or the user forgot the "-". It never waits.
void NoteUnreadInput();

// Reads an input to its end, at most `limit` bytes. After a fault it has complained, the status is
// not good, and `bytes` has everything before the fault.
struct WholeInput {
  std::string bytes;
  Status status = kGood;
};
WholeInput ReadInput(const std::string &file, uint64_t limit);

}  // namespace tools

#endif
