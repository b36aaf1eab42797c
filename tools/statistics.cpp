#include "tools/statistics.h"

#include <fmt/format.h>

#include <cerrno>
#include <cstddef>
#include <unordered_set>
#include <utility>

#include "fleet/dump.h"
#include "fleet/judge.h"
#include "tools/input.h"
#include "tools/memory.h"

namespace tools {
namespace {

static_assert(offsetof(KVRStatsCxt, namesHead) == offsetof(GenericParserCxt, namesHead));
static_assert(offsetof(KVRStatsCxt, valuesHead) == offsetof(GenericParserCxt, valuesHead));

// Whether the name consists of `base` and that number.
bool IsElement(std::string_view name, std::string_view base, size_t number) {
  const fmt::format_int digits(number);
  return name.starts_with(base) &&
         name.substr(base.size()) == std::string_view(digits.data(), digits.size());
}

}  // namespace

Dump ReadDumpFile(const std::string &file, MorwickStream stream, const std::string &className) {
  Dump dump;
  dump.source = {"file", file};
  dump.subject = DisplayName(file);
  dump.row = className.empty() ? nand_exporters : fleet::FindRow(className);
  if (stream == kMorwickMSP && dump.row->mspParseBufferToCxt == nullptr) {
    Complain(dump.subject, std::string(dump.row->className) + " has no MSP statistics");
    dump.status = kBadUsage;
  } else {
    WholeInput input = ReadInput(file, fleet::kLargestDump);
    dump.status = input.status;
    if (input.status == kGood || !input.bytes.empty()) dump.bytes = std::move(input.bytes);
  }
  return dump;
}

Dump ReadDump(Controller &controller, MorwickStream stream) {
  Dump dump;
  dump.source = {"controller", controller.name()};
  dump.subject = controller.name() + ": " + std::string(fleet::NameOf(stream));
  dump.row = controller.row();
  dump.status = kBadData;
  if (!controller.connected()) return dump;
  dump.bytes = controller.Read(*FindBufferKind(fleet::NameOf(stream)));
  if (dump.bytes) dump.status = kGood;
  return dump;
}

Dump ReadDumpLive(MorwickStream stream, const std::string &className) {
  Controller controller(className, std::string(fleet::NameOf(stream)));
  return ReadDump(controller, stream);
}

Statistics::Statistics(const Dump &dump, MorwickStream stream,
                       std::shared_ptr<const fleet::Selection> filter)
    : row_(dump.row), stream_(stream), filter_(std::move(filter)) {
  const char *bytes = dump.bytes->data();
  const auto size = static_cast<uint32_t>(dump.bytes->size());
  // A parse may use up all memory. Printing its entries still needs some.
  MemoryReserve reserve(8 << 20);  // bytes
  errno = 0;
  switch (stream) {
    case kMorwickKVR:
      result_ = static_cast<uint64_t>(row_->parseBufferToCxt(&context_.kvr, bytes, size));
      break;
    case kMorwickFTL: result_ = row_->ftlParseBufferToCxt(&context_.generic, bytes, size); break;
    case kMorwickMSP: result_ = row_->mspParseBufferToCxt(&context_.generic, bytes, size); break;
  }
  outOfMemory_ = errno == ENOMEM;  // malloc sets it; not every parser reports each refusal
}

Statistics::~Statistics() {
  if (stream_ == kMorwickKVR) {
    row_->releaseContext(&context_.kvr);
  } else {
    row_->releaseGenericParserCxt(&context_.generic);
  }
}

std::optional<uint64_t> Statistics::Find(std::string_view name) const {
  std::optional<uint64_t> value;
  for (EntryIterator entry = First(); entry != std::default_sentinel; ++entry) {
    if (entry->name() == name) value = entry->value();
  }
  return value;
}

Status Statistics::Check(const Dump &dump) const {
  if (outOfMemory_) {
    size_t count = 0;
    for (EntryIterator entry = First(); entry != std::default_sentinel; ++entry) ++count;
    Complain(dump.subject, fmt::format("out of memory after {} entries", count));
    return kBadData;
  }
  // When bytes are missing, the place where the statistics end means nothing.
  if (dump.status != kGood) return dump.status;
  const fleet::Verdict verdict = fleet::JudgeDump(stream_, *dump.bytes);
  for (const std::string &fault : verdict.faults) Complain(dump.subject, fault);
  if (!verdict.note.empty()) Note(dump.subject, verdict.note);
  return verdict.faults.empty() ? kGood : kBadData;
}

std::optional<EntryGroup> TakeGroup(EntryIterator *next) {
  EntryIterator &entry = *next;
  if (entry == std::default_sentinel) return std::nullopt;
  EntryGroup group = {entry, 1, entry->name()};
  ++entry;
  if (!group.base.ends_with('0')) return group;
  const std::string_view base = group.base.substr(0, group.base.size() - 1);
  while (entry != std::default_sentinel && IsElement(entry->name(), base, group.count)) {
    ++group.count;
    ++entry;
  }
  if (group.IsArray()) group.base = base;
  return group;
}

std::vector<fleet::Figure> SummaryOf(const Statistics &statistics) {
  // A field is also 0 when the dump lacks it, so look for its entry.
  std::unordered_set<std::string_view> names;
  for (EntryIterator next = statistics.begin(); const auto group = TakeGroup(&next);) {
    names.insert(group->base);
  }
  return fleet::Summarise(statistics.summary(),
                          [&](std::string_view name) { return names.contains(name); });
}

}  // namespace tools
