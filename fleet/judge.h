// What is wrong with a dump, in words: those that `stats`, `table` and the Python module say.
#ifndef FLEET_JUDGE_H
#define FLEET_JUDGE_H

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "morwick/records.h"

namespace fleet {

// "1 byte", "2 bytes".
std::string Bytes(uint64_t count);

struct Verdict {
  std::vector<std::string> faults;  // none for a good dump
  std::string note;                 // what is remarkable, and no fault

  // All of them in one line; empty for a good dump.
  std::string Fault() const;
};

// Looks over a dump while somebody walks through its records.
class Judge {
 public:
  explicit Judge(std::string_view dump) : dump_(dump) {}

  // For each record of the walk.
  void Take(const MorwickRecord &record);

  // For what ended it.
  Verdict Finish(const MorwickRecord &end);

 private:
  std::string_view dump_;
  Verdict verdict_;
  uint64_t otherLengths_ = 0;
  bool hasValues_ = false;
};

// The same for somebody who does not walk.
Verdict JudgeDump(MorwickStream stream, std::string_view dump);

}  // namespace fleet

#endif
