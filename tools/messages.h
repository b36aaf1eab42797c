// The messages of the morwick command: lines on standard error, which JSON repeats.
#ifndef TOOLS_MESSAGES_H
#define TOOLS_MESSAGES_H

#include <chrono>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace tools {

enum Status {
  kGood = 0,
  kBadData = 1,     // no controller; data that is bad or incomplete; output that cannot be written
  kBadUsage = 2,    // arguments that make no sense
  kUnreadable = 2,  // input that cannot be read
};

// A complaint tells why the status of the command is not good. A note leaves the status alone. Each
// is one line on standard error; a terminal gets no control characters.
void Complain(const std::string &subject, const std::string &reason);
void Note(const std::string &subject, const std::string &reason);

// Complains of wrong arguments, and returns the status for them. `help` has the arguments that make
// morwick explain the right ones.
Status RefuseUsage(const std::string &reason, const std::string &help = "--help");

// A line on the terminal that tells how far the work is. It is written again and again in the same
// place.
class ProgressLine {
 public:
  // The line first appears after the delay, or never when it is not shown.
  ProgressLine(bool isShown, std::chrono::milliseconds delay);
  ~ProgressLine() { Clear(); }
  ProgressLine(const ProgressLine &) = delete;
  ProgressLine &operator=(const ProgressLine &) = delete;

  // Whether the caller must write the line now, from its beginning ("\r").
  bool IsDue();
  // Call it before another line is printed.
  void Clear();

 private:
  std::chrono::steady_clock::time_point next_;
  bool isThere_ = false;
};

// Complains that memory was refused. It needs no memory, and prints its line only once.
void ComplainOfMemory();

// From this call on messages are kept, a thousand at most, until an object of JSON prints them.
void KeepMessages();

struct Message {
  std::string_view severity;  // "error" or "note"
  std::string text;
};

// Hands over the messages that were kept. When there were too many, or memory was refused, the last
// one tells how many more there were.
std::vector<Message> TakeMessages();

// How many messages were printed on a terminal so far, without those of ComplainOfMemory.
uint64_t LinesPrinted();

}  // namespace tools

#endif
