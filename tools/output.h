// Standard output of the morwick command.
#ifndef TOOLS_OUTPUT_H
#define TOOLS_OUTPUT_H

#include <csignal>
#include <ctime>
#include <string_view>

#include "tools/messages.h"

namespace tools {

// Call it once, before anything else. It sets the original standard output aside for Output. Lines
// that the library prints then go to standard error. A standard stream that was closed is opened so
// that writing to it fails.
void PrepareStreams();

// The descriptor that now has the file which `number` had when the command was started; -1 for one
// of the command's own.
int OriginalDescriptor(int number);

// Whether data goes to a terminal.
bool OutputIsTerminal();

// Standard output with a buffer. It reports each failed write, so that no data is lost silently,
// and needs no memory from the heap. A terminal gets no control characters.
class Output {
 public:
  Output();

  // False when writing has failed; the caller can stop then.
  bool Write(std::string_view text) {
    while (text.size() > kRoom - length_) {
      const size_t part = text.copy(buffer_ + length_, kRoom - length_);
      length_ += part;
      text.remove_prefix(part);
      if (!Flush()) return false;
    }
    length_ += text.copy(buffer_ + length_, text.size());
    return error_ == 0;
  }

  void Put(char c) {
    if (length_ == kRoom) Flush();
    buffer_[length_++] = c;
  }

  // Writes the buffer out, because a reader may wait for it. On a terminal the first bytes of a
  // character stay in the buffer until the rest has come. False when writing has failed.
  bool Flush();

  // Writes the buffer out, then a control sequence for the terminal.
  void Control(std::string_view sequence);

  // How many rows and columns the terminal's window has; at least two rows and a column.
  struct Size {
    size_t rows, columns;
  };
  static Size Window();

  // Waits until the time has passed or a signal arrives; meanwhile the mask is in force. False when
  // the reader at the other end has gone away, which counts as a failed write.
  bool WaitWithReader(const timespec &time, const sigset_t &mask);

  // Writes the buffer out and returns `status`. When a write has failed it complains and returns
  // kBadData. When the reader has gone away the process ends without a message, by SIGPIPE.
  Status Finish(Status status);

 private:
  static constexpr size_t kRoom = 64 << 10;  // bytes

  bool WriteOut(std::string_view bytes);

  bool terminal_;
  int error_ = 0;
  size_t length_ = 0;
  char buffer_[kRoom] = {};
};

}  // namespace tools

#endif
