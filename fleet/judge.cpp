// What is wrong with a dump, in words.

#include "fleet/judge.h"

#include "fleet/streams.h"

namespace fleet {
namespace {

// Faults that name a record of another length. More are counted: a hostile dump has millions.
constexpr uint64_t kMostNamed = 3;

// The beginning of a fault; `where` tells the record's place.
std::string BeginFault(const MorwickRecord &record, const std::string &where) {
  const std::string name = record.key == nullptr ? "" : std::string(", ") + record.key->name;
  return "the record " + where + " (key " + std::to_string(record.id) + name + ") ";
}

std::string AtOffset(const MorwickRecord &record) {
  return "at offset " + std::to_string(record.offset);
}

// Why the walk ended; empty for a good end.
std::string FaultOf(const MorwickRecord &end) {
  switch (end.step) {
    case kMorwickRecord:
    case kMorwickEndOfBuffer:
    case kMorwickEndRecord: break;
    case kMorwickBadKey: return BeginFault(end, "there") + "has no valid key";
    case kMorwickTooLong:
      return BeginFault(end, "there") + "needs " + Bytes(end.length) + ", and " +
             std::to_string(end.left) + " are left";
    case kMorwickPartOfHeader: return "the rest, " + Bytes(end.left) + ", is not a whole header";
  }
  return "";
}

}  // namespace

std::string_view PackedFormat(std::string_view data) {
  constexpr std::pair<std::string_view, std::string_view> kFormats[] = {
      {"\x28\xb5\x2f\xfd", "zstd"},
      {std::string_view("\xfd\x37\x7a\x58\x5a\0", 6), "xz"},
      {"BZh", "bzip2"},
      {"\x1f\x8b", "gzip"},  // also what is left of a file that was packed twice
      {"PK\x03\x04", "zip"}};
  for (const auto &[begin, name] : kFormats) {
    if (data.starts_with(begin)) return name;
  }
  return "";
}

std::string Bytes(uint64_t count) {
  return std::to_string(count) + (count == 1 ? " byte" : " bytes");
}

std::string Verdict::Fault() const {
  std::string all;
  for (const std::string &fault : faults) all += (all.empty() ? "" : "; ") + fault;
  return all;
}

void Judge::Take(const MorwickRecord &record) {
  hasValues_ = hasValues_ || record.valueCount > 0;
  if (record.lengthDiffers == 0 || ++otherLengths_ > kMostNamed) return;
  const uint64_t configured = uint64_t{record.key->valueCount} * record.valueWidth;
  verdict_.faults.push_back(BeginFault(record, AtOffset(record)) + "has " + Bytes(record.length) +
                            ", and " + std::to_string(configured) + " are configured");
}

Verdict Judge::Finish(const MorwickRecord &end) {
  if (dump_.empty()) return {{"there is nothing in it"}, ""};
  const std::string fault = FaultOf(end);
  if (const auto format = PackedFormat(dump_); !format.empty() && (!fault.empty() || !hasValues_)) {
    return {{"this is " + std::string(format) + " data, and must be unpacked first"}, ""};
  }
  if (otherLengths_ > kMostNamed) {
    verdict_.faults.push_back(std::to_string(otherLengths_ - kMostNamed) +
                              " more records have another length than is configured");
  }
  if (!fault.empty()) {
    verdict_.faults.push_back("the statistics end " + AtOffset(end) + ": " + fault);
  } else if (end.following > 0) {
    verdict_.note = Bytes(end.following) + (end.following == 1 ? " follows" : " follow") +
                    " the end record " + AtOffset(end);
  }
  if (!hasValues_ && verdict_.faults.empty()) verdict_.faults.emplace_back("no statistics found");
  return std::move(verdict_);
}

Verdict JudgeDump(MorwickStream stream, std::string_view dump) {
  Judge judge(dump);
  return judge.Finish(
      WalkRecords(stream, dump, [&](const MorwickRecord &record) { judge.Take(record); }));
}

}  // namespace fleet
