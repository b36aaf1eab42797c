// The walk over records, the key tables, the summary fields, the rounding of capacities and the
// check of snapshot headers: what tools ask the library beside its parsers.

#include <cstring>

#include "tests/unit_test.h"

namespace {

constexpr const char *kSteps[] = {"record",  "end of buffer", "end record",
                                  "bad key", "too long",      "part of a header"};

// What the walk says of each record and of the end, as the cases write it down.
std::string Walk(Kind kind, const std::string &bytes) {
  const std::vector<char> buffer = Unaligned(bytes);
  const char *start = buffer.data() + 1;
  MorwickRecordReader reader;
  MorwickRecord record;
  std::ostringstream seen;
  MorwickStartRecords(&reader, static_cast<MorwickStream>(kind), start, bytes.size());
  const auto next = [&] {
    RefuseAllocation(0);
    const bool isRecord = MorwickNextRecord(&reader, &record) != 0;
    EXPECT_EQ(RefuseAllocation(0), 0U) << "heap was used";
    EXPECT_EQ(isRecord, record.step == kMorwickRecord);
    return isRecord;
  };
  while (next()) {
    EXPECT_EQ(static_cast<const char *>(record.values) + record.length + record.following,
              start + bytes.size());
    EXPECT_EQ(record.left, record.length + record.following);
    EXPECT_EQ(record.valueWidth, kind == kMSP ? 4U : 8U);
    seen << record.id << "@" << record.offset << (record.key == nullptr ? "?" : "") << " "
         << record.valueCount << "/" << record.recordedValues
         << (record.lengthDiffers != 0 ? "!" : "") << ", ";
  }
  const MorwickRecord end = record;
  EXPECT_FALSE(next()) << "the end stays the end";
  EXPECT_TRUE(record.step == end.step && record.offset == end.offset);
  EXPECT_TRUE(end.key == nullptr && end.valueCount == 0 && end.lengthDiffers == 0);
  seen << kSteps[end.step] << "@" << end.offset;
  if (end.step > kMorwickEndOfBuffer && end.step < kMorwickPartOfHeader) {
    seen << ", key " << end.id << " with " << end.length << " of " << end.left << ", "
         << end.following << " follow";
  } else {
    EXPECT_TRUE(end.id == 0 && end.length == 0 && end.left == bytes.size() - end.offset);
  }
  return seen.str();
}

TEST(RecordsTest, WalksToEveryKindOfEnd) {
  ForEachCase("records.txt", [](std::istringstream &columns) {
    const Kind kind = KindOf(TakeColumn(columns));
    const std::string stream = TakeColumn(columns);
    EXPECT_EQ(Walk(kind, Stream(kind, stream)), TakeColumn(columns));
  });
}

TEST(RecordsTest, TakesNullPointersAndUnknownStreams) {
  const std::string bytes = Stream(kKVR, "4:1 9");
  const auto unknown = static_cast<MorwickStream>(3);
  MorwickRecordReader reader = {};
  MorwickRecord record = {};
  MorwickStartRecords(nullptr, kMorwickKVR, bytes.data(), bytes.size());
  EXPECT_EQ(MorwickNextRecord(nullptr, &record) + MorwickNextRecord(&reader, nullptr), 0);
  const char *none = nullptr;
  for (const auto &[stream, buffer] : {std::pair(kMorwickMSP, none), {unknown, bytes.data()}}) {
    MorwickStartRecords(&reader, stream, buffer, bytes.size());
    EXPECT_EQ(MorwickNextRecord(&reader, &record), 0);
    EXPECT_TRUE(record.step == kMorwickEndOfBuffer && record.offset == 0);
  }
  MorwickStartRecords(&reader, kMorwickKVR, bytes.data(), bytes.size());
  EXPECT_EQ(MorwickNextRecord(&reader, &record), 1);
  EXPECT_EQ(MorwickValue(&record, 0), 9U);
  EXPECT_EQ(MorwickValue(&record, 1) + MorwickValue(nullptr, 0), 0U);
  char name[kMorwickNameRoom] = "kept";
  EXPECT_EQ(MorwickValueName(kMorwickKVR, nullptr, 1, 0, name), 0U);
  EXPECT_STREQ(name, "");
  EXPECT_EQ(MorwickValueName(kMorwickKVR, record.key, 1, 0, nullptr), 0U);
}

TEST(RecordsTest, ListsAndFindsEveryKey) {
  EXPECT_EQ(MorwickFindKey(kMorwickKVR, nullptr), nullptr);
  for (int number = kMorwickKVR; number <= kMorwickMSP + 1; ++number) {
    const auto stream = static_cast<MorwickStream>(number);  // the last one is unknown
    const uint32_t count = MorwickKeyCount(stream);
    EXPECT_EQ(count == 0, number > kMorwickMSP);
    for (uint32_t i = 0; i < count; ++i) {
      EXPECT_EQ(MorwickFindKey(stream, MorwickKeyAt(stream, i)->name), MorwickKeyAt(stream, i));
    }
    EXPECT_EQ(MorwickKeyAt(stream, count), nullptr);
    for (const char *none : {"", "versio"}) EXPECT_EQ(MorwickFindKey(stream, none), nullptr);
  }
}

TEST(SummaryTest, ReadsNothingOutsideTheContextAndGoesByTheKey) {
  KVRStatsCxt context;
  std::memset(&context, 0xff, sizeof context);
  uint32_t count = 0;
  while (const MorwickSummaryField *field = MorwickSummaryFieldAt(count++)) {
    EXPECT_NE(MorwickSummaryValue(&context, field, field->valueCount - 1), 0U);
    EXPECT_EQ(MorwickSummaryValue(&context, field, field->valueCount), 0U);
    EXPECT_EQ(MorwickSummaryValue(nullptr, field, 0), 0U);
    const MorwickKey *key = MorwickFindKey(kMorwickKVR, field->name);
    EXPECT_TRUE(key != nullptr && key->id == field->id) << field->name;
  }
  EXPECT_EQ(MorwickSummaryFieldCount(), count - 1);
  EXPECT_EQ(MorwickSummaryValue(&context, nullptr, 0), 0U);
}

TEST(CapacityTest, RoundsToSignificantDigits) {
  ForEachCase("rounding.txt", [](std::istringstream &columns) {
    uint64_t value, digits, rounded;
    EXPECT_TRUE(columns >> value >> digits >> rounded);
    EXPECT_EQ(roundSig(value, digits), rounded);
  });
}

// Buffers end where the header ends.
TEST(SnapshotHeaderTest, SaysWhatIsWrong) {
  ForEachCase("headers.txt", [](std::istringstream &columns) {
    std::vector<uint32_t> words(40, 0x01010101);
    uint32_t count, size;
    columns >> words[1] >> words[2] >> words[6] >> count >> size;
    std::string header(reinterpret_cast<const char *>(words.data()), words.size() * 4);
    header[41] = '\0';
    header.replace(42, 4, reinterpret_cast<const char *>(&count), 4);
    const std::vector<char> unaligned = Unaligned(header.substr(0, size));
    char text[kMorwickHeaderTextRoom] = "kept";
    const auto fault = MorwickCheckSnapshotHeader(unaligned.data() + 1, size, text);
    EXPECT_EQ(MorwickCheckSnapshotHeader(unaligned.data() + 1, size, nullptr), fault);
    TakeColumn(columns);
    EXPECT_EQ(std::to_string(fault) + (text[0] == '\0' ? "" : " ") + text, TakeColumn(columns));
  });
  EXPECT_EQ(MorwickCheckSnapshotHeader(nullptr, 36, nullptr), kMorwickHeaderTooShort);
}

}  // namespace
