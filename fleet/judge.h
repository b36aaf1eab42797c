// Tells what is wrong with a dump, in the words of `stats`, `table` and the Python module.
#ifndef FLEET_JUDGE_H
#define FLEET_JUDGE_H

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "morwick/records.h"

namespace fleet {

// The format of packed data, by its first bytes; empty when they tell nothing.
std::string_view PackedFormat(std::string_view data);

// "1 byte", "2 bytes".
std::string Bytes(uint64_t count);

struct Verdict {
  std::vector<std::string> faults;  // none for a good dump
  std::string note;                 // something to know that is no fault

  // All faults in one line; empty for a good dump.
  std::string Fault() const;
};

// Judges a dump while the caller walks through its records.
class Judge {
 public:
  explicit Judge(std::string_view dump) : dump_(dump) {}

  // Call it for each record of the walk.
  void Take(const MorwickRecord &record);

  // Call it for the end of the walk.
  Verdict Finish(const MorwickRecord &end);

 private:
  std::string_view dump_;
  Verdict verdict_;
  uint64_t otherLengths_ = 0;  // records whose length is not the configured one
  bool hasValues_ = false;
};

// Walks through the dump and judges it.
Verdict JudgeDump(MorwickStream stream, std::string_view dump);

}  // namespace fleet

#endif
