// The streams of statistics, by the names that people use for them.
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

}  // namespace fleet

#endif
