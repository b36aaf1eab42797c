// What the morwick command says about its work: lines on standard error, kept for JSON.
#ifndef TOOLS_MESSAGES_H
#define TOOLS_MESSAGES_H

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace tools {

enum Status {
  kGood = 0,
  kBadData = 1,   // no controller; data that is bad or incomplete; output that cannot be written
  kBadUsage = 2,  // wrong usage; input that cannot be read
};

// One line on standard error, as it stands; to a terminal without control characters.
void PrintLine(const std::string &text);

// A complaint is one line on standard error, and makes the status of the command bad; a note is a
// line that does not.
void Complain(const std::string &subject, const std::string &reason);
void Note(const std::string &subject, const std::string &reason);

// Complaints of one kind, of which a hostile file makes millions: the first few are said, the
// others counted.
class RepeatedComplaint {
 public:
  explicit RepeatedComplaint(std::string subject) : subject_(std::move(subject)) {}

  // `makeReason` is called for those that are said.
  template <typename MakeReason>
  void Add(MakeReason makeReason) {
    if (++count_ <= kMostSaid) Complain(subject_, makeReason());
  }

  // Says how many more there were, if any: "7 more" and what they do. True when there was any at
  // all.
  bool Finish(const std::string &whatTheyDo) const {
    if (count_ > kMostSaid)
      Complain(subject_, std::to_string(count_ - kMostSaid) + " more " + whatTheyDo);
    return count_ > 0;
  }

 private:
  static constexpr uint64_t kMostSaid = 3;

  std::string subject_;
  uint64_t count_ = 0;
};

// The complaint that memory was refused. Its line is printed once, and takes no memory.
void ComplainOfMemory();

// From then on messages are kept, a thousand at most, for an object of JSON that prints them.
void KeepMessages();

// How many lines were said so far.
uint64_t LinesSaid();

struct Message {
  std::string_view severity;  // error, note
  std::string text;
};
const std::vector<Message> &KeptMessages();

// How many messages were not kept, because there are too many or for want of memory.
uint64_t LeftOutMessages();

void ForgetMessages();

}  // namespace tools

#endif
