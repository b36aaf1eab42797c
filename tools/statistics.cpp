// Statistics: where a dump comes from, what a parser makes of it, and its entries.

#include "tools/statistics.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstddef>
#include <cstdlib>
#include <optional>
#include <utility>

#include "tools/memory.h"
#include "tools/records.h"

namespace tools {
namespace {

static_assert(offsetof(KVRStatsCxt, namesHead) == offsetof(GenericParserCxt, namesHead));
static_assert(offsetof(KVRStatsCxt, valuesHead) == offsetof(GenericParserCxt, valuesHead));

// Whether the name is `base` and the number.
bool IsElement(std::string_view name, std::string_view base, size_t number) {
  char digits[20];
  const char *end = std::to_chars(digits, std::end(digits), number).ptr;
  return name.starts_with(base) &&
         name.substr(base.size()) == std::string_view(digits, static_cast<size_t>(end - digits));
}

}  // namespace

Dump ReadDumpFile(const std::string &file, std::string_view stream, const std::string &className) {
  Dump dump;
  dump.source = {"file", file};
  dump.subject = DisplayName(file);
  dump.row = className.empty() ? nand_exporters : FindRow(className);
  if (stream == "msp" && dump.row->mspParseBufferToCxt == nullptr) {
    Complain(dump.subject, std::string(dump.row->className) + " has no MSP statistics");
    dump.status = kBadUsage;
  } else if (std::optional<std::string> bytes = ReadInput(file, kLargestDump)) {
    dump.bytes = std::move(*bytes);
  } else {
    dump.status = kBadUsage;
  }
  return dump;
}

Dump ReadDump(Controller &controller, std::string_view stream) {
  Dump dump;
  dump.source = {"controller", controller.name()};
  dump.subject = controller.name() + ": " + std::string(stream);
  dump.row = controller.row();
  dump.status = kBadData;
  if (!controller.connected()) return dump;
  if (std::optional<std::string> bytes = controller.Read(*FindBufferKind(stream))) {
    dump.bytes = std::move(*bytes);
    dump.status = kGood;
  }
  return dump;
}

Dump ReadDumpLive(std::string_view stream, const std::string &className) {
  Controller controller(className, std::string(stream));
  return ReadDump(controller, stream);
}

Statistics::Statistics(const Dump &dump, std::string_view stream)
    : row_(dump.row), stream_(stream) {
  const auto size = static_cast<uint32_t>(dump.bytes.size());
  // After a parse that took all the memory that there is, what it gave is to be printed.
  MemoryReserve reserve(8 << 20);
  errno = 0;
  if (stream == "kvr") {
    result_ = static_cast<uint64_t>(row_->parseBufferToCxt(&context_.kvr, dump.bytes.data(), size));
  } else if (stream == "ftl") {
    result_ = row_->ftlParseBufferToCxt(&context_.generic, dump.bytes.data(), size);
  } else if (stream == "msp") {
    result_ = row_->mspParseBufferToCxt(&context_.generic, dump.bytes.data(), size);
  }
  outOfMemory_ = errno == ENOMEM;  // the heap's own word: not every parser reports each refusal
  reserve.GiveUp();
  if (GlobalAPIErrorMessage != nullptr) message_ = GetAPIErrorMessage();
  // The library keeps its first message only; here each dump has its own.
  std::free(std::exchange(GlobalAPIErrorMessage, nullptr));
}

Statistics::~Statistics() {
  if (stream_ == "kvr") {
    row_->releaseContext(&context_.kvr);
  } else {  // the others share a context
    row_->releaseGenericParserCxt(&context_.generic);
  }
}

Status Statistics::Judge(const Dump &dump) const {
  Status status = kGood;
  const auto complain = [&](const std::string &reason) {
    Complain(dump.subject, reason);
    status = kBadData;
  };
  if (dump.bytes.empty()) {
    complain("there is nothing in it");
    return status;
  }
  if (outOfMemory_) {
    size_t count = 0;
    for (const ContextNode *name = names(); name != nullptr; name = name->next) ++count;
    complain("out of memory after " + std::to_string(count) + " entries");
    return status;
  }
  if (!message_.empty()) complain(message_);
  const StatisticsEnd end = FindEnd(stream_, dump.bytes);
  const std::string where = "offset " + std::to_string(end.offset);
  if (!end.fault.empty()) {
    complain("the statistics end at " + where + ": " + end.fault);
  } else if (end.surplus > 0) {
    Note(dump.subject,
         "behind the end record at " + where + " follow " + std::to_string(end.surplus) + " bytes");
  }
  if (names() == nullptr && status == kGood) complain("no statistics found");
  return status;
}

EntryGroup EntryReader::TakeGroup() {
  EntryGroup group = {name_, value_, 0, name_->text};
  const auto next = [&] {
    ++group.count;
    name_ = name_->next;
    value_ = value_->next;
  };
  next();
  if (!group.base.ends_with('0')) return group;
  const std::string_view base = group.base.substr(0, group.base.size() - 1);
  while (name_ != nullptr && IsElement(name_->text, base, group.count)) next();
  if (group.IsArray()) group.base = base;
  return group;
}

std::vector<SummaryField> SummaryOf(const Statistics &statistics) {
  const KVRStatsCxt &summary = statistics.summary();
  std::vector<SummaryField> fields = {
      {"exportVersion", {summary.exportVersion}},
      {"numVirtualBlocks", {summary.numVirtualBlocks}},
      {"blocksPerVirtualBlock", {summary.blocksPerVirtualBlock}},
      {"pagesPerVirtualBlock", {summary.pagesPerVirtualBlock}},
      {"bytesPerPage", {summary.bytesPerPage}},
      {"hostReads", {summary.hostReads}},
      {"hostWrites", {summary.hostWrites}},
      {"numFreeVirtualBlocks", {summary.numFreeVirtualBlocks}},
      {"wearLevMoves", {summary.wearLevMoves}},
      {"nandReads", {summary.nandReads}},
      {"nandWrites", {summary.nandWrites}},
      {"bandErases", {summary.bandErases}},
      {"IND_pool_free", {summary.IND_pool_free}},
      {"IND_pool_count", {summary.IND_pool_count}},
      {"utilFormatTime", {summary.utilFormatTime}},
      {"numSleepOps", {summary.numSleepOps}},
      {"maxHighEnduranceBlockErases", {summary.maxHighEnduranceBlockErases}},
      {"readCountHisto", {std::begin(summary.readCountHisto), std::end(summary.readCountHisto)}},
  };
  // A field is 0 too when the dump lacked it: its entries tell.
  std::vector<bool> present(fields.size());
  for (EntryReader reader(statistics); !reader.AtEnd();) {
    const EntryGroup group = reader.TakeGroup();
    const auto field = std::ranges::find(fields, group.base, &SummaryField::name);
    if (field != fields.end()) present[static_cast<size_t>(field - fields.begin())] = true;
  }
  size_t index = 0;
  std::erase_if(fields, [&](const SummaryField &) { return !present[index++]; });
  return fields;
}

}  // namespace tools
