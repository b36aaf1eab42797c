// Walks the records of a dump, to say where its statistics end and why.
#ifndef TOOLS_RECORDS_H
#define TOOLS_RECORDS_H

#include <cstdint>
#include <string>
#include <string_view>

namespace tools {

struct StatisticsEnd {
  uint64_t offset = 0;   // of what ends them
  std::string fault;     // why, when that is no good end
  uint64_t surplus = 0;  // bytes behind an end record
};

// By the rules of the parser of the stream, which is kvr, ftl or msp.
StatisticsEnd FindEnd(std::string_view stream, std::string_view dump);

}  // namespace tools

#endif
