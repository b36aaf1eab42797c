// Statistics: where a dump comes from, what a parser makes of it, and its entries.

#include "tools/statistics.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstddef>
#include <optional>
#include <utility>

#include "tools/memory.h"

namespace tools {
namespace {

static_assert(offsetof(KVRStatsCxt, namesHead) == offsetof(GenericParserCxt, namesHead));
static_assert(offsetof(KVRStatsCxt, valuesHead) == offsetof(GenericParserCxt, valuesHead));

MorwickStream StreamOf(std::string_view name) {
  return name == "msp" ? kMorwickMSP : name == "ftl" ? kMorwickFTL : kMorwickKVR;
}

// The record that a complaint is about; `where` it is.
std::string Name(const MorwickRecord &record, const std::string &where) {
  const std::string name = record.key == nullptr ? "" : std::string(", ") + record.key->name;
  return "the record " + where + " (key " + std::to_string(record.id) + name + ") ";
}

std::string AtOffset(const MorwickRecord &record) {
  return "at offset " + std::to_string(record.offset);
}

std::string Bytes(uint64_t count) {
  return std::to_string(count) + (count == 1 ? " byte" : " bytes");
}

// Why the records end there, when that is no good end.
std::string FaultOf(const MorwickRecord &end) {
  switch (end.step) {
    case kMorwickRecord:
    case kMorwickEndOfBuffer:
    case kMorwickEndRecord: break;
    case kMorwickBadKey: return Name(end, "there") + "has no valid key";
    case kMorwickTooLong:
      return Name(end, "there") + "needs " + Bytes(end.length) + ", and " +
             std::to_string(end.left) + " are left";
    case kMorwickPartOfHeader: return "the rest, " + Bytes(end.left) + ", is not a whole header";
  }
  return "";
}

// Says which records of a dump are not as configured, and where its statistics end and why.
Status JudgeRecords(const std::string &subject, MorwickStream stream, std::string_view dump) {
  MorwickRecordReader reader;
  MorwickRecord record;
  RepeatedComplaint otherLengths(subject);
  MorwickStartRecords(&reader, stream, dump.data(), dump.size());
  while (MorwickNextRecord(&reader, &record) != 0) {
    if (record.lengthDiffers == 0) continue;
    otherLengths.Add([&] {
      return Name(record, AtOffset(record)) + "has " + Bytes(record.length) + ", and " +
             std::to_string(uint64_t{record.key->valueCount} * record.valueWidth) +
             " are configured";
    });
  }
  Status status =
      otherLengths.Finish("records have another length than is configured") ? kBadData : kGood;
  if (const std::string fault = FaultOf(record); !fault.empty()) {
    Complain(subject, "the statistics end " + AtOffset(record) + ": " + fault);
    status = kBadData;
  } else if (record.following > 0) {
    Note(subject, Bytes(record.following) + (record.following == 1 ? " follows" : " follow") +
                      " the end record at offset " + std::to_string(record.offset));
  }
  return status;
}

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
}

Statistics::~Statistics() {
  if (stream_ == "kvr") {
    row_->releaseContext(&context_.kvr);
  } else {  // the others share a context
    row_->releaseGenericParserCxt(&context_.generic);
  }
}

Status Statistics::Judge(const Dump &dump) const {
  const auto complain = [&](const std::string &reason) {
    Complain(dump.subject, reason);
    return kBadData;
  };
  if (dump.bytes.empty()) return complain("there is nothing in it");
  if (outOfMemory_) {
    size_t count = 0;
    for (const ContextNode *name = names(); name != nullptr; name = name->next) ++count;
    return complain("out of memory after " + std::to_string(count) + " entries");
  }
  const Status status = JudgeRecords(dump.subject, StreamOf(stream_), dump.bytes);
  if (names() == nullptr && status == kGood) return complain("no statistics found");
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
  std::vector<SummaryField> fields;
  for (uint32_t i = 0; i < MorwickSummaryFieldCount(); ++i) {
    const MorwickSummaryField &field = *MorwickSummaryFieldAt(i);
    fields.push_back({field.name, {}});
    for (uint32_t k = 0; k < field.valueCount; ++k) {
      fields.back().values.push_back(MorwickSummaryValue(&statistics.summary(), &field, k));
    }
  }
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
