// Input and output of the morwick command.
#ifndef TOOLS_IO_H
#define TOOLS_IO_H

#include <csignal>
#include <cstdint>
#include <ctime>
#include <optional>
#include <string>
#include <string_view>

#include "fleet/gzip.h"
#include "tools/descriptor.h"
#include "tools/messages.h"

namespace tools {

// Once, before anything else. Data goes to what was standard output from then on, and everything
// that the library prints to standard error; streams that were closed are taken by something that
// cannot be written.
void PrepareStreams();

// Writes everything, waiting where it must. 0, or the number of the error.
int WriteAll(int descriptor, std::string_view bytes);

// The descriptor that now stands for what this number meant when the command was started; -1 for
// one of the command's own.
int OriginalDescriptor(int number);

// What a file is called in messages; "-" is standard input.
std::string DisplayName(const std::string &file);

// The bytes of a file, or of standard input for "-", in blocks as they arrive; unpacked where they
// are compressed by gzip. Shows progress on a terminal when it takes longer than a second, unless
// what is made of the first blocks may be there already.
class Input {
 public:
  explicit Input(const std::string &file, bool showProgress = true);
  ~Input() { ClearProgress(); }
  Input(const Input &) = delete;
  Input &operator=(const Input &) = delete;

  // The size of a regular file; 0 where it cannot be known.
  uint64_t size() const { return size_; }

  // Reads at most `room` bytes, at least one unless the end has come (0). Without a value it has
  // complained.
  std::optional<size_t> Read(char *bytes, size_t room);

  // Says what is wrong with the input.
  void Refuse(const std::string &reason);

 private:
  fleet::ReadResult ReadRaw(char *bytes, size_t room);
  void ShowProgress();
  void ClearProgress();

  std::string name_;
  Descriptor file_;
  int descriptor_;  // of the file, or standard input
  int error_ = 0;   // of opening it
  uint64_t size_ = 0;
  uint64_t read_ = 0;
  bool progressShown_ = false;
  int64_t nextProgress_ = INT64_MAX;  // on no terminal, never
  fleet::GzipReader reader_{[this](char *bytes, size_t room) { return ReadRaw(bytes, room); }};
};

// A note, when there is something to be read on standard input that nobody asked for: it may be
// meant for somebody else, or it may be what should have been read. Waits for nothing.
void NoteUnreadInput();

// Reads the whole of an input, but not more than `limit` bytes. What was read before a fault is
// there; the status is good when there was none, and otherwise it has complained.
struct WholeInput {
  std::string bytes;
  Status status = kGood;
};
WholeInput ReadInput(const std::string &file, uint64_t limit);

// Standard output, checked: nothing is cut silently. It has a buffer and takes no memory else. To a
// terminal no control characters are written.
class Output {
 public:
  Output();

  // False when writing has failed; there is no point in going on then.
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

  // Writes out what is buffered, for whoever waits for it at the other end of a pipe. At a terminal
  // a character that has come in part waits for the rest of it.
  bool Flush();

  // Writes a control sequence to the terminal, after what is buffered.
  void Control(std::string_view sequence);

  // How many rows and columns the terminal's window has; at least two rows and a column.
  struct Size {
    size_t rows, columns;
  };
  static Size Window();

  // Waits, under that signal mask, for the time to pass or a signal. False when the reader at the
  // other end has gone away, which then counts as a failed write.
  bool WaitWithReader(const timespec &time, const sigset_t &mask);

  // Flushes. Complains and turns `status` into kBadData when anything failed; a reader that has
  // gone away ends the process in silence, as it ends other programs.
  Status Finish(Status status);

 private:
  static constexpr size_t kRoom = 64 << 10;

  bool WriteOut(std::string_view bytes);

  bool terminal_;
  int error_ = 0;
  size_t length_ = 0;
  char buffer_[kRoom] = {};
};

// Whether data goes to a terminal.
bool OutputIsTerminal();

}  // namespace tools

#endif
