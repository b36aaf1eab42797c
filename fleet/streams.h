// The streams of statistics, by the names that people use for them, and the walk over their
// records.
#ifndef FLEET_STREAMS_H
#define FLEET_STREAMS_H

#include <optional>
#include <string>
#include <string_view>

#include "morwick/records.h"

namespace fleet {

inline constexpr MorwickStream kStreams[] = {kMorwickKVR, kMorwickFTL, kMorwickMSP};

// kvr, ftl or msp.
constexpr std::string_view NameOf(MorwickStream stream) {
  switch (stream) {
    case kMorwickKVR: return "kvr";
    case kMorwickFTL: return "ftl";
    case kMorwickMSP: return "msp";
  }
  return "";
}

constexpr std::optional<MorwickStream> StreamNamed(std::string_view name) {
  for (const MorwickStream stream : kStreams) {
    if (name == NameOf(stream)) return stream;
  }
  return std::nullopt;
}

// Calls `take` with each record of a dump. Returns what ended the walk.
template <typename Take>
MorwickRecord WalkRecords(MorwickStream stream, std::string_view dump, Take take) {
  MorwickRecordReader reader;
  MorwickRecord record;
  MorwickStartRecords(&reader, stream, dump.data(), dump.size());
  while (MorwickNextRecord(&reader, &record) != 0) take(record);
  return record;
}

}  // namespace fleet

#endif
