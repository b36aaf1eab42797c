// What a file holds by its looks.

#include "tools/likely_content.h"

#include <algorithm>

#include "fleet/streams.h"
#include "morwick/snapshot.h"
#include "tools/text.h"

namespace tools {
namespace {

// A record of a snapshot has many zeros: the upper bytes of its numbers.
bool LooksLikeText(std::string_view beginning) {
  beginning = beginning.substr(0, sizeof(SnapshotRecord));
  beginning.remove_suffix(IncompleteEnd(beginning));
  const auto isControl = [](unsigned char c) { return c < ' ' && (c < '\t' || c > '\r'); };
  return IsValidText(beginning) && std::ranges::none_of(beginning, isControl);
}

// Of records with a known key and its number of values a snapshot has hardly one, and never most.
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
  return known > 1 && known > others;
}

}  // namespace

std::string_view OtherThanSnapshot(std::string_view beginning) {
  if (LooksLikeText(beginning)) return "text";
  for (const MorwickStream stream : fleet::kStreams) {
    if (LooksLikeStatistics(stream, beginning)) return "statistics";
  }
  return "";
}

}  // namespace tools
