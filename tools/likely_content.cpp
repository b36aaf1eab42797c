// Guesses what a file holds.

#include "tools/likely_content.h"

#include "fleet/judge.h"
#include "fleet/streams.h"
#include "morwick/snapshot.h"

namespace tools {
namespace {

// Text in UTF-8, Latin-1 or UTF-16. A snapshot's record has control characters instead, or pairs of
// bytes 0, the upper halves of its numbers, or pairs of bytes 0xff, which is erased flash.
bool LooksLikeText(std::string_view beginning) {
  beginning = beginning.substr(0, sizeof(SnapshotRecord));
  for (size_t i = 0; i < beginning.size(); ++i) {
    const auto byte = static_cast<unsigned char>(beginning[i]);
    const bool isEqualPair = i % 2 == 1 && beginning[i] == beginning[i - 1];
    if (isEqualPair && (byte == 0 || byte == 0xff)) return false;
    if (byte > 0 && byte < '\t') return false;
    if (byte > '\r' && byte < ' ' && byte != '\x1b') return false;
  }
  return true;
}

// A snapshot hardly has more than two records with a known key and its number of values. Statistics
// of a newer firmware may have almost three times as many others.
bool LooksLikeStatistics(MorwickStream stream, std::string_view beginning) {
  uint64_t known = 0;
  uint64_t others = 0;
  MorwickRecordReader reader;
  MorwickRecord record;
  MorwickStartRecords(&reader, stream, beginning.data(), beginning.size());
  while (MorwickNextRecord(&reader, &record) != 0) {
    const bool fits = record.key != nullptr &&
                      record.length == uint64_t{record.key->valueCount} * record.valueWidth;
    ++(fits ? known : others);
  }
  return known > 2 && known * 3 > others;
}

}  // namespace

std::string OtherThanSnapshot(std::string_view beginning) {
  if (const auto format = fleet::PackedFormat(beginning); !format.empty()) {
    return std::string(format) + " data";
  }
  if (LooksLikeText(beginning)) return "text";
  for (const MorwickStream stream : fleet::kStreams) {
    if (LooksLikeStatistics(stream, beginning)) return "statistics";
  }
  return "";
}

}  // namespace tools
