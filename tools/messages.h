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

// Complains of wrong arguments, and returns the status for them; `help` are the arguments with
// which morwick explains the right ones.
Status RefuseUsage(const std::string &reason, const std::string &help = "--help");

// Complaints of one kind. A hostile file causes millions of them, so the first few are printed and
// the others are counted.
class RepeatedComplaint {
 public:
  explicit RepeatedComplaint(std::string subject) : subject_(std::move(subject)) {}

  // Calls `makeReason` only for a complaint that is printed.
  template <typename MakeReason>
  void Add(MakeReason makeReason) {
    if (++count_ <= kMostPrinted) Complain(subject_, makeReason());
  }

  // Prints how many were only counted: "7 more records do not fit", where `whatTheyDo` is "records
  // do not fit". True when there was any complaint.
  bool Finish(const std::string &whatTheyDo) const {
    if (count_ > kMostPrinted) {
      Complain(subject_, std::to_string(count_ - kMostPrinted) + " more " + whatTheyDo);
    }
    return count_ > 0;
  }

 private:
  static constexpr uint64_t kMostPrinted = 3;

  std::string subject_;
  uint64_t count_ = 0;
};

// A line on the terminal that tells how far the work is. It is written again and again in the same
// place.
class ProgressLine {
 public:
  // The line stays away for the first milliseconds; for ever where it is not shown.
  ProgressLine(bool isShown, std::chrono::milliseconds delay);
  ~ProgressLine() { Clear(); }
  ProgressLine(const ProgressLine &) = delete;
  ProgressLine &operator=(const ProgressLine &) = delete;

  // Whether to write it now, at its beginning.
  bool IsDue();
  // Call it before another line is printed.
  void Clear();

 private:
  std::chrono::steady_clock::time_point next_;
  bool isThere_ = false;
};

// Complains that memory was refused. It needs no memory, and prints its line only once.
void ComplainOfMemory();

// From then on messages are kept, a thousand at most, until an object of JSON prints them.
void KeepMessages();

// How many lines were printed so far.
uint64_t LinesPrinted();

struct Message {
  std::string_view severity;  // error, note
  std::string text;
};
const std::vector<Message> &KeptMessages();

// How many messages were not kept, because there were too many or memory was refused.
uint64_t LeftOutMessages();

void ForgetMessages();

}  // namespace tools

#endif
