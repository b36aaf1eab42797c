// What the morwick command says about its work: lines on standard error, kept for JSON.
#ifndef TOOLS_MESSAGES_H
#define TOOLS_MESSAGES_H

#include <cstdint>
#include <string>
#include <string_view>
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

// The complaint that memory was refused. Its line is printed once, and takes no memory.
void ComplainOfMemory();

// From then on messages are kept, a thousand at most, for an object of JSON that prints them.
void KeepMessages();

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
