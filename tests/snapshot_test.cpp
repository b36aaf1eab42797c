// Both snapshot renderings, byte for byte and through buffers of every size, and the number
// helpers.

#include <gtest/gtest.h>

#include <cstdarg>
#include <cstring>
#include <fstream>
#include <random>
#include <sstream>

#include "morwick/morwick.h"
#include "tests/heap.h"

namespace {

std::string Printf(const char *format, ...) __attribute__((format(printf, 1, 2)));
std::string Printf(const char *format, ...) {
  char text[2000];
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(text, sizeof text, format, arguments);
  va_end(arguments);
  return text;
}

using Words = std::vector<uint32_t>;

std::string Bytes(const Words &words) {
  return {reinterpret_cast<const char *>(words.data()), words.size() * 4};
}

// A record whose numbers are of all magnitudes.
Words MixedRecord(uint32_t seed) {
  std::mt19937 random(seed);
  Words words(63);
  for (uint32_t &word : words) word = static_cast<uint32_t>(random() >> random() % 32);
  return words;
}

// The line as its format is written down, by the byte offsets of the layout.
std::string ExpectedLine(const Words &words) {
  const auto at = [&](size_t offset) { return words[offset / 4]; };
  std::string line = Printf(
      "T=%04u E=%02u HR=%4u HW=%4u NR=%4u NW=%4u TH=%8u.%02u GC=%4u W=%2u BI=%3u BU=%3u V=%5u "
      "BF=%2u/%2u P=%2u H=%2u/%2u X=%2u/%2u L=%3u/%3u C=%2u/%2u S=%4u U=%8u RO=%4u",
      at(0), at(104), at(108), at(112), at(116), at(120), at(156) / 1000, at(156) % 1000 / 10,
      at(124), at(132), at(144), at(148), at(180), at(188), at(192), at(4), at(164), at(160),
      at(200), at(204), at(172), at(176), at(212), at(216), at(168), at(208), at(56));
  for (size_t k = 1; k < 4; ++k) line += Printf("/%4u", at(56 + 12 * k));
  const struct {
    const char *label;
    size_t offset;
    int width;
  } groups[] = {{"RL", 60, 7}, {"RM", 64, 5}, {"WO", 8, 4}, {"WL", 12, 7}, {"WM", 16, 5}};
  for (const auto &[label, offset, width] : groups) {
    for (size_t k = 0; k < 4; ++k) {
      line += k == 0 ? Printf(" %s=", label) : "/";
      line += Printf("%*u", width, at(offset + 12 * k));
    }
  }
  return line + "\n";
}

// What a call left behind, in a buffer whose end is watched.
struct Rendered {
  uint64_t result;
  uint64_t size;  // as the call set it
  std::string text;
};

Rendered Render(const std::string &snapshot, uint64_t capacity) {
  const ExactBuffer input(snapshot);
  const ExactBuffer output(std::string(capacity, 'x'));
  Rendered rendered = {0, capacity, ""};
  RefuseAllocation(1);
  rendered.result =
      KVRParseSnapshotBuffer(input.data(), snapshot.size(), output.data(), &rendered.size);
  EXPECT_EQ(AllocationCount(), 0U) << "heap was used";
  RefuseAllocation(0);
  if (capacity > 0) rendered.text = output.data();
  return rendered;
}

const std::string &Legend() {
  static const std::string legend = [] {
    std::string text = Render("", 2000).text;
    text.pop_back();
    return text;
  }();
  return legend;
}

TEST(FixedSnapshotTest, StartsWithTheLegend) {
  const Rendered rendered = Render("", 1339);
  EXPECT_EQ(rendered.result, 1U);
  EXPECT_EQ(rendered.size, 1338U);
  EXPECT_EQ(Legend().size(), 1337U);
  EXPECT_TRUE(Legend().starts_with("Key: \nT   - Timestamp\n"));
  EXPECT_NE(Legend().find("(Min/Max)S   - Number of free segs\nU   -"), std::string::npos);
  EXPECT_TRUE(Legend().ends_with("for this time interval: priority0/priority1/...\n\n"));
}

TEST(FixedSnapshotTest, PrintsEveryMagnitude) {
  std::string snapshot;
  std::string expected = Legend();
  for (uint32_t i = 0; i < 500; ++i) {
    snapshot += Bytes(MixedRecord(i));
    expected += ExpectedLine(MixedRecord(i));
  }
  for (const uint32_t value :
       {0U, 9U, 10U, 99U, 100U, 99999999U, 100000000U, 999999999U, 1000000000U, 4294967295U}) {
    snapshot += Bytes(Words(63, value));
    expected += ExpectedLine(Words(63, value));
  }
  const Rendered rendered = Render(snapshot + "part of a record", 1 << 20);
  EXPECT_EQ(rendered.result, 1U);
  EXPECT_EQ(rendered.text, expected + "\n");
  EXPECT_EQ(rendered.size, rendered.text.size());
}

TEST(FixedSnapshotTest, CutsTheTextAtAnyCapacity) {
  const std::string snapshot = Bytes(MixedRecord(1)) + Bytes(MixedRecord(2));
  const std::string whole = Render(snapshot, 10000).text;
  for (uint64_t capacity = 0; capacity <= whole.size() + 1; ++capacity) {
    const Rendered rendered = Render(snapshot, capacity);
    const bool fits = capacity > whole.size();
    ASSERT_EQ(rendered.result, fits ? 1U : 0U) << capacity;
    ASSERT_EQ(rendered.size, fits ? whole.size() : capacity);
    ASSERT_EQ(rendered.text, whole.substr(0, capacity == 0 ? 0 : capacity - 1));
  }
}

struct Descriptor {
  uint16_t kind;
  uint32_t offset;
  uint32_t size;
  const char *format;
};

constexpr uint32_t kTableOffset = 52;  // leaves room for fifteen characters of text

std::string Header(uint32_t version, uint32_t recordSize, uint32_t recordCount,
                   const std::vector<Descriptor> &descriptors) {
  std::string header = Bytes({9, version, recordSize, recordCount, 9, 9, kTableOffset, 9, 9});
  header += std::string("header text") + std::string(kTableOffset - header.size() - 11, '\0');
  header += Bytes({static_cast<uint32_t>(descriptors.size()), 9});
  for (const Descriptor &descriptor : descriptors) {
    header += Bytes({descriptor.kind | 9U << 16, descriptor.offset, descriptor.size});
    header += (std::string(descriptor.format) + std::string(16, '\0')).substr(0, 16);
  }
  return header;
}

struct Snapshot {
  std::string header;
  std::string records;
};

Rendered RenderInplace(const Snapshot &snapshot, uint64_t capacity, uint32_t *state) {
  const ExactBuffer header(snapshot.header, 1);
  const ExactBuffer records(snapshot.records, 3);
  const ExactBuffer output(std::string(capacity, 'x'));
  Rendered rendered = {0, capacity, ""};
  RefuseAllocation(1);
  rendered.result = KVRParseSnapshotBufferWithInplaceParser(
      records.data(), snapshot.records.size(), output.data(), &rendered.size, header.data(), state);
  EXPECT_EQ(AllocationCount(), 0U) << "heap was used";
  RefuseAllocation(0);
  if (capacity > 0) {
    rendered.text = output.data();
    EXPECT_EQ(rendered.size, rendered.text.size() + 1);
  }
  return rendered;
}

// Three-word records: index + 1, and two numbers of growing length.
std::string CountingRecords(uint32_t count) {
  std::string records;
  for (uint32_t i = 0; i < count; ++i) records += Bytes({i + 1, i * i * 1000, 7});
  return records;
}

const std::vector<Descriptor> kCountingFields = {{0, 0, 0, "N=%u"}, {2, 4, 0, " A=%u.%02u"}};

TEST(InplaceSnapshotTest, PrintsWhatDescriptorsAskFor) {
  const std::string record = Bytes({1, 23456, 30, 31, 32, 40, 41, 42, 0xffffffff});
  std::ifstream cases(CASES "/descriptors.txt");
  int count = 0;
  for (std::string line; std::getline(cases, line);) {
    if (line.starts_with('#')) continue;
    SCOPED_TRACE(line);
    std::istringstream stream(line);
    std::vector<std::string> columns(5);
    for (std::string &column : columns) std::getline(stream, column, '\t');
    for (std::string &column : columns) column = column == "<>" ? "" : column;
    const auto number = [](const std::string &text) { return std::stoul(text, nullptr, 0); };
    const Descriptor descriptor = {static_cast<uint16_t>(number(columns[0])),
                                   static_cast<uint32_t>(number(columns[1])),
                                   static_cast<uint32_t>(number(columns[2])), columns[3].c_str()};
    uint32_t state = 0;
    const Rendered rendered =
        RenderInplace({Header(6, 36, 2, {{4, 0, 0, ""}, descriptor}), record}, 1000, &state);
    EXPECT_EQ(rendered.text, "- KVR Snapshot - \nheader text\n" + columns[4] + "\n");
    EXPECT_TRUE(rendered.result == 1 && state == 1);
    ++count;
  }
  EXPECT_GT(count, 30);
}

// Every conversion that passes the check prints what the C library prints.
TEST(InplaceSnapshotTest, PrintsNumbersAsPrintfDoes) {
  std::mt19937 random(1);
  const auto pick = [&](std::string_view from) { return from[random() % from.size()]; };
  for (int round = 0; round < 20000; ++round) {
    std::string format = "%";
    while (random() % 2 == 0 && format.size() < 5) format += pick("-+ #0");
    if (random() % 2 == 0) format += std::to_string(random() % 15);
    if (random() % 3 == 0) format += "." + std::to_string(random() % 14);
    format += pick("diuoxX");
    const auto value = static_cast<uint32_t>(random() >> random() % 33 % 32);
    const Snapshot snapshot = {Header(6, 8, 2, {{4, 0, 0, ""}, {0, 4, 0, format.c_str()}}),
                               Bytes({1, value})};
    char expected[100];
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
    std::snprintf(expected, sizeof expected, format.c_str(), value);
#pragma GCC diagnostic pop
    uint32_t state = 0;
    ASSERT_EQ(RenderInplace(snapshot, 1000, &state).text,
              "- KVR Snapshot - \nheader text\n" + std::string(expected) + "\n")
        << format << " of " << value;
  }
}

TEST(InplaceSnapshotTest, EndsWhereHeaderOrSnapshotEnd) {
  const std::string banner = "- KVR Snapshot - \nheader text\n";
  const std::string first = "N=1 A=0.00\n";
  const std::string second = "N=2 A=1.00\n";
  const std::string three = CountingRecords(3);
  std::string emptySecond = three;
  emptySecond[12] = 0;
  const struct {
    std::string header, records;
    std::string text;
    uint32_t state;
  } cases[] = {{Header(5, 12, 2, kCountingFields), three, Legend() + first, 1},
               {Header(6, 12, 3, kCountingFields), three, banner + first + second, 2},
               {Header(6, 12, 3, kCountingFields), emptySecond, banner + first, 2},
               {Header(6, 12, 1, kCountingFields), three, "", 0},
               {Header(6, 12, 0, kCountingFields), three, "", 0},
               {Header(6, 12, 0xffffffff, kCountingFields), three,
                banner + first + second + "N=3 A=4.00\n", 3},
               {Header(6, 12, 9, kCountingFields), three.substr(0, 35), banner + first + second, 2},
               {Header(6, 12, 9, kCountingFields), "", "", 0},
               {Header(6, 0, 0xffffffff, kCountingFields), three, "", 0xfffffffe},
               {Header(6, 3, 0xffffffff, kCountingFields), three, "", 12},
               {Header(6, 12, 3, {}), three, "", 2},
               {Header(6, 12, 2, std::vector<Descriptor>(50, {0, 0, 0, "%u"})), three,
                banner + std::string(50, '1') + "\n", 1},
               {Header(6, 12, 3, {{0, 9, 0, "%u"}, {0, 0, 0, "%u"}}), three, "", 2},
               {Header(6, 0xffffffff, 3, kCountingFields), three, "", 0}};
  for (const auto &[header, records, text, state] : cases) {
    SCOPED_TRACE(testing::Message() << "case " << &header - &cases[0].header);
    uint32_t reached = 0;
    const Rendered rendered = RenderInplace({header, records}, 5000, &reached);
    EXPECT_EQ(rendered.result, 1U);
    EXPECT_EQ(rendered.text, text);
    EXPECT_EQ(reached, state);
    EXPECT_EQ(RenderInplace({header, records}, 5000, &reached).text, state == 0 ? text : "");
    EXPECT_EQ(reached, state) << "a further call changes nothing";
  }
}

// Call after call through each buffer, against what the rules say of each call.
TEST(InplaceSnapshotTest, PassesThroughBuffersOfAnySize) {
  constexpr uint32_t kCount = 12;
  const Snapshot snapshot = {Header(6, 12, kCount + 1, kCountingFields),
                             CountingRecords(kCount + 1)};
  const std::string banner = "- KVR Snapshot - \nheader text\n";
  uint32_t all = 0;
  const std::string whole = RenderInplace(snapshot, 5000, &all).text;
  for (uint64_t capacity = 1; capacity <= whole.size() + 1; ++capacity) {
    uint32_t state = 0;
    for (int call = 0; call < 20; ++call) {
      // The rules, plainly.
      uint64_t used = 0;
      std::string expected;
      uint32_t reached = state;
      uint64_t result = 1;
      if (state == 0) {
        used = banner.size();
        if (used >= capacity) result = 0;
      }
      std::string text = used > 0 ? banner : "";
      while (result == 1 && reached < kCount) {
        const std::string line = Printf("N=%u A=%u.00\n", reached + 1, reached * reached);
        ++reached;
        if (text.size() + line.size() >= capacity) {
          result = 0;
        } else {
          text += line;
          expected = text;
        }
      }
      const Rendered rendered = RenderInplace(snapshot, capacity, &state);
      ASSERT_EQ(rendered.text, expected) << "capacity " << capacity << ", call " << call;
      ASSERT_EQ(rendered.result, result);
      ASSERT_EQ(state, reached);
    }
  }
}

TEST(InplaceSnapshotTest, ChargesNothingForHugeWidths) {
  for (const char *format : {"%2000000000u", "%.2000000000u", "%9999999999999u", "%.4000000000x"}) {
    const Snapshot snapshot = {Header(6, 4, 3, {{0, 0, 0, format}}), Bytes({1, 2, 3})};
    uint32_t state = 0;
    const Rendered rendered = RenderInplace(snapshot, 1000, &state);
    EXPECT_EQ(rendered.result, 0U);
    EXPECT_EQ(rendered.text, "");
    EXPECT_EQ(state, 1U);
  }
}

TEST(SnapshotTest, TakesNullPointersAndNoRoom) {
  char output[2000] = "untouched";
  uint64_t size = sizeof output;
  uint32_t state = 7;
  const std::string header = Header(6, 12, 3, kCountingFields);
  EXPECT_EQ(KVRParseSnapshotBuffer(nullptr, 252, output, &size), 0U);
  EXPECT_EQ(KVRParseSnapshotBuffer(output, 0, nullptr, &size), 0U);
  EXPECT_EQ(KVRParseSnapshotBuffer(output, 0, output, nullptr), 0U);
  const auto inplace = KVRParseSnapshotBufferWithInplaceParser;
  EXPECT_EQ(inplace(output, 36, output, &size, nullptr, &state), 0U);
  EXPECT_EQ(inplace(output, 36, nullptr, &size, header.data(), &state), 0U);
  EXPECT_EQ(inplace(output, 36, output, nullptr, header.data(), &state), 0U);
  EXPECT_EQ(inplace(output, 36, output, &size, header.data(), nullptr), 0U);
  uint64_t none = 0;
  EXPECT_EQ(inplace(output, 36, output, &none, header.data(), &state), 0U);
  EXPECT_STREQ(output, "untouched");
  EXPECT_EQ(size, sizeof output);
  EXPECT_EQ(state, 7U);
  state = 0;
  EXPECT_EQ(inplace(nullptr, 36, output, &size, header.data(), &state), 1U);
}

TEST(CapacityTest, RoundsToSignificantDigits) {
  std::ifstream cases(CASES "/rounding.txt");
  int count = 0;
  for (uint64_t value, digits, rounded; cases >> value >> digits >> rounded; ++count) {
    EXPECT_EQ(roundSig(value, digits), rounded) << value << " to " << digits;
  }
  EXPECT_EQ(count, 18);
}

}  // namespace
