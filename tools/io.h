// Input, output and complaints of the morwick command.
#ifndef TOOLS_IO_H
#define TOOLS_IO_H

#include <sys/types.h>

#include <csignal>
#include <cstdint>
#include <ctime>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tools {

enum Status {
  kGood = 0,
  kBadData = 1,   // no controller; data that is bad or incomplete; output that cannot be written
  kBadUsage = 2,  // wrong usage; input that cannot be read
};

// Once, before anything else. Data goes to what was standard output from then on, and everything
// that the library prints to standard error; streams that were closed are taken by something that
// cannot be written; memory is limited, so that a hostile dump ends with a message.
void PrepareStreams();
void LimitMemory();

// One line on standard error, as it stands; to a terminal without control characters.
void PrintLine(const std::string &text);

// A complaint is one line on standard error, and makes the status of the command bad; a note is a
// line that does not. Both are kept for the JSON output.
void Complain(const std::string &subject, const std::string &reason);
void Note(const std::string &subject, const std::string &reason);

struct Message {
  std::string severity;
  std::string text;
};
const std::vector<Message> &Messages();
void ForgetMessages();

// What a file is called in messages; "-" is standard input.
std::string DisplayName(const std::string &file);

// The bytes of a file, or of standard input for "-", in blocks as they arrive. Shows progress on a
// terminal when it takes longer than a second, unless what is made of the first blocks may be there
// already.
class Input {
 public:
  explicit Input(const std::string &file, bool showProgress = true);
  ~Input();
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
  void ShowProgress();
  void ClearProgress();

  std::string name_;
  int descriptor_;
  int error_ = 0;  // of opening it
  uint64_t size_ = 0;
  uint64_t read_ = 0;
  bool progressShown_ = false;
  int64_t nextProgress_ = INT64_MAX;  // on no terminal, never
};

// Reads the whole of an input. Without a value it has complained: it cannot be read or is larger
// than `limit` bytes.
std::optional<std::string> ReadInput(const std::string &file, uint64_t limit);

// Writes a file whole or not at all: beside it first, then renamed, with that mode or as the umask
// gives it. What is no regular file (a device, a pipe) is written directly, and so is an open
// descriptor (/dev/stdout, /dev/fd/3). False after a complaint.
bool WriteFile(const std::string &file, std::string_view bytes,
               std::optional<mode_t> mode = std::nullopt);

// Standard output, checked: nothing is cut silently. It has a buffer and takes no memory else. To a
// terminal no control characters are written.
class Output {
 public:
  Output();

  // False when writing has failed; there is no point in going on then.
  bool Write(std::string_view text) {
    if (text.size() > kRoom - length_) return WriteRoundTheBuffer(text);
    text.copy(buffer_ + length_, text.size());
    length_ += text.size();
    return error_ == 0;
  }

  void Put(char c) {
    if (length_ == kRoom) Flush();
    buffer_[length_++] = c;
  }

  // Writes out what is buffered, for whoever waits for it at the other end of a pipe.
  bool Flush();

  // Waits, under that signal mask, for the time to pass or a signal. False when the reader at the
  // other end has gone away, which then counts as a failed write.
  bool WaitWithReader(const timespec &time, const sigset_t &mask);

  // Flushes. Complains and turns `status` into kBadData when anything failed; a reader that has
  // gone away ends the process in silence, as it ends other programs.
  Status Finish(Status status);

 private:
  static constexpr size_t kRoom = 64 << 10;

  bool WriteRoundTheBuffer(std::string_view text);
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
