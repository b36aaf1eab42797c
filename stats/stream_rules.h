// The rules by which the parser of each stream takes a record: its key, whether its length is the
// configured one, and how its values are named. The parsers and morwick/records.h share them.
#ifndef STATS_STREAM_RULES_H
#define STATS_STREAM_RULES_H

#include <cstdint>
#include <string_view>

#include "stats/key_table.h"
#include "stats/record_walk.h"

namespace morwick {

template <MorwickStream kStream>
struct StreamRules {
  static constexpr uint32_t kValueWidth = kStream == kMorwickMSP ? 4 : 8;

  static const MorwickKey *FindKey(uint32_t id) {
    if constexpr (kStream == kMorwickMSP) return kMSPKeys.Find(id);
    return kStatsKeys.Find(id);
  }

  // Whether the parser reports the record's length as different. The KVR parser goes by the key
  // alone, and an FTL scalar may carry more than its one value.
  static bool LengthDiffers(const MorwickKey &key, uint64_t length) {
    if constexpr (kStream == kMorwickKVR) return false;
    if (kStream == kMorwickFTL && key.valueCount == 1) return false;
    return length != uint64_t{key.valueCount} * kValueWidth;
  }

  // The text between the name of an array and the index of a value.
  static std::string_view Separator(const MorwickKey &key) {
    return kStream == kMorwickFTL && key.valueCount > 1 ? "_" : "";
  }
};

// A record of a known key.
struct KnownRecord {
  const MorwickKey &key;
  const uint8_t *values;
  uint64_t length;      // of the payload, in bytes
  uint32_t valueCount;  // values that the parser takes
};

inline std::string_view NameOf(const MorwickKey &key) { return {key.name, key.nameLength}; }

// Calls `take` with each record of a known key until `take` returns false. Returns what ended the
// walk; kMorwickRecord when `take` did.
template <MorwickStream kStream, typename Take>
MorwickStep ForEachKnownRecord(const void *buffer, uint32_t size, Take take) {
  const auto *bytes = static_cast<const uint8_t *>(buffer);
  uint64_t offset = 0;
  for (;;) {
    WalkedRecord walked;
    const MorwickStep step = WalkToRecord(kStream, bytes, size, offset, &walked);
    if (step != kMorwickRecord) return step;
    if (const MorwickKey *key = StreamRules<kStream>::FindKey(walked.id)) {
      const uint32_t count =
          ValuesTaken(kStream, walked.payload, walked.length, size, key->valueCount);
      if (!take(KnownRecord{*key, bytes + walked.payload, walked.length, count})) return step;
    }
    offset = walked.payload + walked.length;
  }
}

}  // namespace morwick

#endif
