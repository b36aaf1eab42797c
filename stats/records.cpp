// The public walk over the records of a dump. The proved walk finds each record; this adds its key
// and the values that a parser takes from it.

#include "morwick/records.h"

#include <algorithm>
#include <cstring>
#include <span>
#include <string_view>

#include "stats/decimal.h"
#include "stats/entry_list.h"
#include "stats/stream_rules.h"

namespace morwick {
namespace {

std::span<const MorwickKey> KeysOf(MorwickStream stream) {
  switch (stream) {
    case kMorwickKVR:
    case kMorwickFTL: return kStatsKeys.rows;
    case kMorwickMSP: return kMSPKeys.rows;
  }
  return {};
}

// Describes the end of the walk. The reader stays there, so that later calls return it again.
int DescribeEnd(MorwickStep step, const WalkedRecord &walked, uint32_t valueWidth,
                MorwickRecordReader &reader, MorwickRecord &record) {
  const uint64_t left = reader.size - walked.payload;
  record = {};
  record.step = step;
  record.id = walked.id;
  record.offset = reader.offset = walked.offset;
  record.length = walked.length;
  record.left = left;
  record.following = walked.length < left ? left - walked.length : 0;
  record.valueWidth = valueWidth;
  return 0;
}

// One function for each stream, so that its rules are constants there: this halves the time.
template <MorwickStream kStream>
int NextRecord(MorwickRecordReader &reader, MorwickRecord &record) {
  using Rules = StreamRules<kStream>;
  WalkedRecord walked;
  const MorwickStep step =
      WalkToRecord(kStream, reader.buffer, reader.size, reader.offset, &walked);
  if (step != kMorwickRecord) {
    return DescribeEnd(step, walked, Rules::kValueWidth, reader, record);
  }
  const uint64_t left = reader.size - walked.payload;
  reader.offset = walked.payload + walked.length;
  const MorwickKey *key = Rules::FindKey(walked.id);
  record.step = kMorwickRecord;
  record.id = walked.id;
  record.offset = walked.offset;
  record.length = walked.length;
  record.left = left;
  record.following = left - walked.length;
  record.key = key;
  record.values = reader.buffer + walked.payload;
  record.valueWidth = Rules::kValueWidth;
  record.recordedValues = static_cast<uint32_t>(walked.length / Rules::kValueWidth);
  record.valueCount = key == nullptr ? 0
                                     : ValuesTaken(kStream, walked.payload, walked.length,
                                                   reader.size, key->valueCount);
  record.lengthDiffers = key != nullptr && Rules::LengthDiffers(*key, walked.length) ? 1 : 0;
  return 1;
}

}  // namespace
}  // namespace morwick

void MorwickStartRecords(MorwickRecordReader *reader, MorwickStream stream, const void *buffer,
                         uint64_t size) {
  if (reader == nullptr) return;
  const bool isKnown = !morwick::KeysOf(stream).empty();
  reader->buffer = static_cast<const uint8_t *>(buffer);
  reader->size = buffer == nullptr || !isKnown ? 0 : size;
  reader->offset = 0;
  reader->stream = isKnown ? stream : kMorwickKVR;
}

int MorwickNextRecord(MorwickRecordReader *reader, MorwickRecord *record) {
  if (reader == nullptr || record == nullptr) return 0;
  switch (reader->stream) {
    case kMorwickKVR: return morwick::NextRecord<kMorwickKVR>(*reader, *record);
    case kMorwickFTL: return morwick::NextRecord<kMorwickFTL>(*reader, *record);
    case kMorwickMSP: return morwick::NextRecord<kMorwickMSP>(*reader, *record);
  }
  return 0;
}

uint64_t MorwickValue(const MorwickRecord *record, uint32_t index) {
  if (record == nullptr || index >= record->valueCount) return 0;
  return morwick::LoadElement(
      static_cast<const uint8_t *>(record->values) + size_t{index} * record->valueWidth,
      record->valueWidth);
}

uint32_t MorwickValueName(MorwickStream stream, const MorwickKey *key, uint32_t valueCount,
                          uint32_t index, char *name) {
  if (name == nullptr) return 0;
  name[0] = '\0';
  if (key == nullptr) return 0;
  const std::string_view separator =
      stream == kMorwickFTL ? morwick::StreamRules<kMorwickFTL>::Separator(*key) : "";
  const morwick::EntryName prefix(morwick::NameOf(*key), separator);
  ContextNode node = prefix.node();
  if (valueCount > 1) prefix.AppendIndex(&node, index);
  static_assert(sizeof node.text <= kMorwickNameRoom);
  const size_t length = std::strlen(node.text);
  std::memcpy(name, node.text, length + 1);
  return static_cast<uint32_t>(length);
}

uint32_t MorwickKeyCount(MorwickStream stream) {
  return static_cast<uint32_t>(morwick::KeysOf(stream).size());
}

const MorwickKey *MorwickKeyAt(MorwickStream stream, uint32_t index) {
  const std::span<const MorwickKey> keys = morwick::KeysOf(stream);
  return index < keys.size() ? &keys[index] : nullptr;
}

const MorwickKey *MorwickFindKey(MorwickStream stream, const char *name) {
  if (name == nullptr) return nullptr;
  const std::span<const MorwickKey> keys = morwick::KeysOf(stream);
  const auto found = std::ranges::find(keys, std::string_view(name), morwick::NameOf);
  return found == keys.end() ? nullptr : &*found;
}
