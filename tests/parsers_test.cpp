// The three statistics parsers and the generic context.

#include <gtest/gtest.h>

#include <algorithm>
#include <random>

#include "tests/case_file.h"
#include "tests/heap.h"
#include "tests/parsing.h"
#include "tests/stream_notation.h"

namespace {

// Parses once, unaligned, into contexts that hold an entry already, while the allocation with the
// number `refused` fails. `how` is the kind, with "-context" or "-data" after it when a null
// pointer takes their place. Returns the visible result as text, and frees all memory.
std::string Parse(const std::string &how, const std::string &stream, size_t refused) {
  const Kind kind = KindOf(how.substr(0, how.find('-')));
  const std::string null = how.substr(std::min(how.size(), how.find('-')));
  EXPECT_TRUE(null.empty() || null == "-context" || null == "-data") << null;
  const std::string bytes = Stream(kind, stream);
  const std::vector<char> buffer = Unaligned(bytes);
  Contexts contexts = {};
  EXPECT_EQ(KVRParseBufferToCxt(&contexts.kvr, Stream(kKVR, "8:1 1").data(), 16), 1);
  EXPECT_EQ(AddSingleValueToGenericContext(&contexts.generic, "valid", "Lbas", 1), 1);
  contexts.kvr.exportVersion = 99;
  contexts.kvr.parseMarker = 5;
  RefuseAllocation(refused);
  const uint64_t result = ParseInto(null == "-context" ? nullptr : &contexts, kind,
                                    null == "-data" ? nullptr : buffer.data() + 1, bytes.size());
  EXPECT_GE(RefuseAllocation(0), refused) << "there were fewer allocations";
  const Entries entries = EntriesOf(contexts, kind);
  EXPECT_TRUE(entries.sound);
  if (refused == 0 && null.empty() && kind != kArray) {
    MorwickRecord end;
    EXPECT_EQ("validLbas=1 " + WalkedEntries(kind, buffer.data() + 1, bytes.size(), &end),
              entries.text)
        << "the walk takes what the parser takes";
  }
  std::string seen = entries.text + "-> " + std::to_string(result);
  const uint32_t version = contexts.kvr.exportVersion;
  if (version != 99) seen += ", version " + std::to_string(version);
  if (const std::string message = TakeMessage(); message != "NA") seen += ", " + message;
  EXPECT_EQ(contexts.kvr.parseMarker, kind == kKVR && null != "-context" ? -1 : 5);
  for (int time = 0; time < 2; ++time) {
    KVRReleaseContext(&contexts.kvr);
    ReleaseGenericParserCxt(&contexts.generic);
  }
  const std::string_view record(reinterpret_cast<const char *>(&contexts), sizeof contexts);
  EXPECT_EQ(record.find_first_not_of('\0'), record.npos) << "released means zero-filled";
  return seen;
}

TEST(ParsersTest, ReadGoodAndBadStreams) {
  ForEachCase("streams.txt", [](std::istringstream &columns) {
    std::string how = TakeColumn(columns);
    const std::string stream = TakeColumn(columns);
    const std::string seen = "validLbas=1 " + TakeColumn(columns);
    const size_t mark = how.find('!');
    if (mark == std::string::npos) {
      EXPECT_EQ(Parse(how, stream, 0), seen);
      return;
    }
    // A message takes one allocation. An entry takes two, for its value and for its name; each is
    // refused once.
    const size_t entry = Number(how.substr(mark + 1));
    how.resize(mark);
    EXPECT_EQ(Parse(how, stream, entry == 0 ? 1 : 2 * entry - 1), seen);
    if (entry > 0) {
      EXPECT_EQ(Parse(how, stream, 2 * entry), seen);
    }
  });
}

TEST(ParsersTest, TakeNullPointersAndHugeSizes) {
  const std::string dump = Stream(kMSP, "4096:4 5");
  GenericParserCxt context = {};
  // The parser keeps the low 32 bits of the size.
  EXPECT_EQ(KVRMSPParseBufferToCxt(&context, dump.data(), 0x500000000), 0U);
  EXPECT_TRUE(TakeMessage().ends_with("Passed in invalid buffer or empty buffer"));
  EXPECT_EQ(KVRMSPParseBufferToCxt(&context, dump.data(), 0x500000008), 1U);
  ReleaseGenericParserCxt(&context);
  KVRReleaseContext(nullptr);
  ReleaseGenericParserCxt(nullptr);
  EXPECT_EQ(AddSingleValueToGenericContext(nullptr, "", "a", 1), 0);
  EXPECT_EQ(AddSingleValueToGenericContext(&context, nullptr, "a", 1), 0);
  EXPECT_EQ(AddSingleValueToGenericContext(&context, "", nullptr, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "a", nullptr, 4, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, nullptr, "abcd", 4, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, nullptr, nullptr, 4, 0), 1);
  std::vector<uint64_t> values(65536);  // of 1 to 64 bits; Entries checks the text
  std::mt19937_64 random(1);
  std::ranges::generate(values, [&] { return random() >> random() % 64; });
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "a", values.data(), 8, 65536), 0);
  EXPECT_EQ(Entries(context).count, 0U);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "a", values.data(), 8, 65535), 1);
  const Entries entries(context);
  EXPECT_TRUE(entries.sound && entries.count == 65535);
  EXPECT_NE(entries.text.find(" a65534="), entries.text.npos);
  ReleaseGenericParserCxt(&context);
  RefuseAllocation(1);
  EXPECT_EQ(AddSingleValueToGenericContext(&context, "", "a", 1), 0);
  RefuseAllocation(0);
  EXPECT_EQ(Entries(context).count, 0U);
}

TEST(ParserContextTest, CutsNamesAt98Characters) {
  const std::string bytes(12345, 1);
  for (const size_t length : {95U, 96U, 97U, 98U, 99U, 120U}) {
    const std::string name(length, 'n');
    GenericParserCxt context = {};
    AddSingleValueToGenericContext(&context, std::string(90, 'a').c_str(), name.c_str(), 0);
    AddMultipleFieldsToGenericContext(&context, name.c_str(), bytes.data(), 1, 12345);
    std::string expected = (std::string(90, 'a') + name).substr(0, 98) + "=0 ";
    for (int i = 0; i < 12345; ++i) expected += (name + std::to_string(i)).substr(0, 98) + "=1 ";
    EXPECT_EQ(Entries(context).text, expected);
    ReleaseGenericParserCxt(&context);
  }
}

}  // namespace
