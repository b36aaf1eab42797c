// Both snapshot renderings, byte for byte and through buffers of every size.

#include <sys/mman.h>

#include <cstring>
#include <iomanip>
#include <random>

#include "tests/unit_test.h"

namespace {

constexpr auto kFixed = KVRParseSnapshotBuffer;
constexpr auto kDescribed = KVRParseSnapshotBufferWithInplaceParser;

// The result of a call, the size that it set, the text and the state.
using Rendered = std::tuple<uint64_t, uint64_t, std::string, uint32_t>;

// One call, with the ends of its buffers watched and the heap counted. In the fixed layout unless
// there is a header.
Rendered Render(const std::string &snapshot, uint64_t capacity, const std::string &header = "",
                uint32_t state = 0) {
  const std::vector<char> records = Unaligned(snapshot);
  const std::vector<char> layout = Unaligned(header);
  std::vector<char> room(capacity + 1, 'x');
  char *output = room.data() + 1;
  uint64_t size = capacity;
  RefuseAllocation(0);
  const uint64_t result = header.empty()
                              ? kFixed(records.data() + 1, snapshot.size(), output, &size)
                              : kDescribed(records.data() + 1, snapshot.size(), output, &size,
                                           layout.data() + 1, &state);
  EXPECT_EQ(RefuseAllocation(0), 0U) << "heap was used";
  return {result, size, capacity == 0 ? "" : output, state};
}

std::string TextOf(const Rendered &rendered) { return std::get<std::string>(rendered); }

std::string Bytes(const std::vector<uint32_t> &words) {
  return {reinterpret_cast<const char *>(words.data()), words.size() * 4};
}

TEST(FixedSnapshotTest, CutsTheTextAtAnyCapacity) {
  const std::string snapshot = Bytes(std::vector<uint32_t>(126, 123456)) + "part of a record";
  const std::string whole = TextOf(Render(snapshot, 10000));
  EXPECT_TRUE(whole.starts_with("Key: \nT   - Timestamp\n") && whole.ends_with("\n\n"));
  for (uint64_t capacity = 0; capacity <= whole.size() + 1; ++capacity) {
    const bool fits = capacity > whole.size();
    const Rendered expected = {fits ? 1U : 0U, fits ? whole.size() : capacity,
                               whole.substr(0, std::max<uint64_t>(capacity, 1) - 1), 0};
    ASSERT_EQ(Render(snapshot, capacity), expected);
  }
}

using Fields = std::vector<SnapshotFieldDescriptor>;

std::string Header(uint32_t version, uint32_t recordSize, uint32_t count, const Fields &fields) {
  constexpr uint32_t kTableOffset = 52;  // leaves room for fifteen characters of text
  std::string header = Bytes({9, version, recordSize, count, 9, 9, kTableOffset, 9, 9});
  header += "header text";
  header.resize(kTableOffset);
  header += Bytes({static_cast<uint32_t>(fields.size()), 9});
  return header.append(reinterpret_cast<const char *>(fields.data()),
                       fields.size() * sizeof(SnapshotFieldDescriptor));
}

const std::string kBanner = "- KVR Snapshot - \nheader text\n";

// Renders one record through a field and a line end.
std::string RenderField(const std::vector<uint32_t> &record, const SnapshotFieldDescriptor &field) {
  const std::string header = Header(6, static_cast<uint32_t>(record.size() * 4), 2,
                                    {{4, 9, 0, 0, ""}, field, {0, 9, 0, 0, "\n"}});
  return TextOf(Render(Bytes(record), 5000, header)).substr(kBanner.size());
}

// Reads a descriptor as cases write it, up to the arrow.
SnapshotFieldDescriptor ReadDescriptor(std::istringstream &columns) {
  SnapshotFieldDescriptor field = {};
  std::string format, arrow;
  columns >> field.kind >> field.fieldOffset >> field.fieldSize >> std::quoted(format) >> arrow;
  EXPECT_TRUE(columns && arrow == "->");
  format.copy(field.format, sizeof field.format);
  return field;
}

TEST(DescribedSnapshotTest, PrintsWhatDescriptorsAskFor) {
  ForEachCase("descriptors.txt", [](std::istringstream &columns) {
    std::string text;
    const SnapshotFieldDescriptor field = ReadDescriptor(columns);
    EXPECT_TRUE(columns >> std::quoted(text));
    EXPECT_EQ(RenderField({1, 23456, 30, 31, 32, 40, 41, 42, 0xffffffff}, field), text + "\n\n");
  });
}

// Every conversion that passes the check prints what the C library prints.
TEST(DescribedSnapshotTest, PrintsNumbersAsPrintfDoes) {
  std::mt19937 random(1);
  const auto pick = [&](std::string_view from) { return from[random() % from.size()]; };
  for (int round = 0; round < 20000; ++round) {
    std::string format = "%";
    while (random() % 2 == 0 && format.size() < 5) format += pick("-+ #0");
    if (random() % 2 == 0) format += std::to_string(random() % 15);
    if (random() % 3 == 0) format += "." + std::to_string(random() % 14);
    format += pick("diuoxX");
    const auto value = static_cast<uint32_t>(random() >> random() % 33 % 32);
    SnapshotFieldDescriptor field = {0, 9, 4, 0, ""};
    format.copy(field.format, sizeof field.format);
    char expected[100];
    std::snprintf(expected, sizeof expected, format.c_str(), value);
    ASSERT_EQ(RenderField({1, value}, field), std::string(expected) + "\n\n") << format;
  }
}

// A count, thousandths, labels without a priority and a priority without labels. When a record has
// twelve bytes, the third is empty, and the fourth is cut.
const Fields kCounting = {
    {0, 9, 0, 0, "N=%u"}, {2, 9, 4, 0, " A=%u.%02u"}, {3, 9, 0, 0, "%4s="}, {3, 9, 12, 12, ""}};
constexpr uint32_t kWords[] = {65536, 0, 7, 2, 100000, 7, 0, 5000, 7, 4, 9000000, 7};
constexpr size_t kSize = sizeof kWords - 1;

// What a call must do, written down plainly.
Rendered Expected(uint32_t recordSize, uint32_t recordCount, const std::string &banner,
                  uint64_t capacity, uint32_t state) {
  std::string text = state == 0 ? banner : "";
  if (text.size() >= capacity) return {0, 1, "", state};
  const uint64_t whole = recordSize == 0 ? UINT32_MAX : kSize / recordSize;
  const auto last = static_cast<uint32_t>(std::min<uint64_t>(std::max(recordCount, 1U) - 1, whole));
  std::string completed;
  while (state < last) {
    const uint32_t *record = &kWords[state * recordSize / 4];
    state = recordSize < 4 ? last : state + 1;  // no room for a field: all records are empty
    if (recordSize < 4 || record[0] == 0) continue;
    text += "N=" + std::to_string(record[0]);
    if (recordSize >= 8) text += " A=" + std::to_string(record[1] / 1000) + ".00";
    text += "   O=   L=   M=";
    if (recordSize >= 24) text += "   2 100000    7";
    text += "\n";
    if (text.size() >= capacity) return {0, completed.size() + 1, completed, state};
    completed = text;
  }
  return {1, completed.size() + 1, completed, state};
}

TEST(DescribedSnapshotTest, KeepsTheRulesCallAfterCall) {
  const std::string records(reinterpret_cast<const char *>(kWords), kSize);
  const std::string legend = TextOf(Render("", 1338));  // no room for the line end after it
  for (const uint32_t recordSize : {0U, 3U, 4U, 8U, 12U, 24U, 0xffffffff}) {
    for (const uint32_t recordCount : {0U, 1U, 2U, 4U, 9U, 0xffffffff}) {
      for (const uint32_t version : {5U, 6U}) {
        const std::string &banner = version < 6 ? legend : kBanner;
        const std::string header = Header(version, recordSize, recordCount, kCounting);
        // Without its descriptor table, which must not be read when no record is printed.
        const std::string bare = header.substr(0, 24) + "\xf0\xff\xff\xff" + header.substr(28, 24);
        const uint64_t first = banner.size() - kBanner.size() + 1;
        for (uint64_t capacity = first; capacity < first + 150; ++capacity) {
          for (uint32_t call = 0, state = 0; call < 10; ++call) {
            const Rendered expected = Expected(recordSize, recordCount, banner, capacity, state);
            const uint32_t newState = std::get<uint32_t>(expected);
            const bool printsNone = newState == state || recordSize < 4;
            const std::string &used = printsNone ? bare : header;
            ASSERT_EQ(Render(records, capacity, used, state), expected) << capacity;
            state = newState;
          }
        }
      }
    }
  }
}

TEST(SnapshotTest, TakesNullPointersAndHugeSizes) {
  char output[2000] = "untouched";
  const std::string header = Header(6, 12, 3, kCounting);
  uint64_t size = sizeof output, none = 0;
  uint32_t state = 7;
  EXPECT_EQ(kFixed(nullptr, 252, output, &size), 0U);
  EXPECT_EQ(kFixed(output, 0, nullptr, &size) + kFixed(output, 0, output, nullptr), 0U);
  EXPECT_EQ(kDescribed(output, 36, nullptr, &size, header.data(), &state), 0U);
  EXPECT_EQ(kDescribed(output, 36, output, nullptr, header.data(), &state), 0U);
  EXPECT_EQ(kDescribed(output, 36, output, &none, header.data(), &state), 0U);
  EXPECT_EQ(kDescribed(output, 36, output, &size, nullptr, &state), 0U);
  EXPECT_EQ(kDescribed(output, 36, output, &size, header.data(), nullptr), 0U);
  EXPECT_STREQ(output, "untouched");
  EXPECT_TRUE(size == sizeof output && state == 7);
  EXPECT_EQ(kDescribed(nullptr, 36, output, &size, header.data(), &(state = 0)), 1U);
  // The number of records, 2^32, is 0 when kept to 32 bits; nothing may be read.
  EXPECT_EQ(kFixed(nullptr, uint64_t{252} << 32, output, &(size = sizeof output)), 1U);
  EXPECT_EQ(size, 1338U);
  // Of records of 2 GiB, the third lies beyond what 32 bits address.
  constexpr size_t kGiB = size_t{1} << 30;
  void *memory = mmap(nullptr, 6 * kGiB, PROT_READ | PROT_WRITE,
                      MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
  EXPECT_NE(memory, MAP_FAILED);
  static_cast<char *>(memory)[4 * kGiB] = 9;
  const std::string huge = Header(6, 2 * kGiB, 4, {{0, 9, 0, 0, "%u"}});
  EXPECT_EQ(kDescribed(memory, 6 * kGiB, output, &(size = 500), huge.data(), &(state = 2)), 1U);
  EXPECT_STREQ(output, "9\n");
  munmap(memory, 6 * kGiB);
  MorwickSnapshotField field = {};
  field.offset = 7;
  EXPECT_EQ(MorwickSnapshotFieldAt(nullptr, 27, &field), 0);
  EXPECT_EQ(MorwickSnapshotFieldAt(nullptr, 0xffffffff, &field), 0);
  EXPECT_EQ(MorwickSnapshotFieldAt(nullptr, 0, nullptr), 0);
  EXPECT_EQ(field.offset, 7U);
}

TEST(DescribedSnapshotTest, ReadsNoDescriptorThatIsNotNeeded) {
  // With a count of 0, the descriptor there does not matter.
  std::string bare = Header(6, 4, 3, {{0, 9, 0, 0, "%u"}});
  bare[52] = 0;
  EXPECT_EQ(Render("no field, no line", 500, bare), (Rendered{1, 1, "", 2}));
  EXPECT_EQ(Render("no field, no line", 500, bare, 7), (Rendered{1, 1, "", 7}));
  // The 32 bits that tell an empty record must lie in it whole.
  for (const uint32_t offset : {4U, 5U, 7U, 8U}) {
    const std::string header = Header(6, 8, 3, {{4, 9, offset, 0, ""}});
    EXPECT_EQ(TextOf(Render("sixteen bytes...", 500, header)), offset == 4 ? kBanner + "\n\n" : "");
  }
  // When no record is printed, only the first descriptor is read.
  bare[52] = 9;
  EXPECT_EQ(Render(std::string(8, '\0'), 500, bare, 1), (Rendered{1, 1, "", 2}));
}

// Each field: kind, offset, priorities, and its names, with the column where it differs.
std::string FieldsOf(const std::string &header) {
  const std::vector<char> unaligned = Unaligned(header);
  std::ostringstream text;
  for (uint32_t i = 0;; ++i) {
    MorwickSnapshotField field;
    RefuseAllocation(0);
    const int isThere = MorwickSnapshotFieldAt(unaligned.data() + 1, i, &field);
    EXPECT_EQ(RefuseAllocation(0), 0U) << "heap was used";
    if (isThere == 0) return text.str();
    text << field.kind << ' ' << field.offset << ' ' << field.priorities;
    for (const auto &[label, column] : field.names) {
      if (*label != '\0') text << ' ' << label;
      if (std::strcmp(label, column) != 0) text << '=' << column;
    }
    text << '\n';
  }
}

TEST(SnapshotFieldsTest, ReadsDescriptorsAndGivesNamesThatDiffer) {
  ForEachCase("fields.txt", [](std::istringstream &lines) {
    std::string line, expected;
    std::getline(lines, line);
    const auto recordSize = static_cast<uint32_t>(Number(line.substr(line.rfind(' ') + 1)));
    Fields fields;
    for (; lines.peek() != EOF; expected += line + "\n") {
      fields.push_back(ReadDescriptor(lines));
      std::getline(lines >> std::ws, line);
    }
    EXPECT_EQ(FieldsOf(Header(6, recordSize, 9, fields)), expected);
  });
}

}  // namespace
