// The three statistics parsers and the generic context.

#include <random>

#include "tests/unit_test.h"

namespace {

// Parses once, unaligned, into contexts that hold an entry already, while the allocation with the
// number `refused` fails. `how` is the kind, with "-context" or "-data" after it when a null
// pointer takes their place. Returns the visible result as text, and frees all memory.
std::string Parse(const std::string &how, const std::string &stream, size_t refused) {
  const Kind kind = KindOf(how.substr(0, how.find('-')));
  const std::string null = how.substr(std::min(how.size(), how.find('-')));
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
    // The walk takes what the parser takes.
    MorwickRecord end;
    EXPECT_EQ("validLbas=1 " + WalkedEntries(kind, buffer.data() + 1, bytes.size(), &end),
              entries.text);
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
    std::vector<size_t> refused = {0};
    if (const size_t mark = how.find('!'); mark != std::string::npos) {
      // A message takes one allocation. An entry takes two, for its value and for its name; each is
      // refused once.
      const size_t entry = Number(how.substr(mark + 1));
      refused = {std::max<size_t>(2 * entry, 2) - 1};
      if (entry > 0) refused.push_back(2 * entry);
      how.resize(mark);
    }
    for (const size_t allocation : refused) EXPECT_EQ(Parse(how, stream, allocation), seen);
  });
}

TEST(ParsersTest, TakeNullPointersAndHugeSizes) {
  GenericParserCxt context = {};
  KVRReleaseContext(nullptr);
  ReleaseGenericParserCxt(nullptr);
  EXPECT_EQ(AddSingleValueToGenericContext(&context, nullptr, "a", 1), 0);
  EXPECT_EQ(AddSingleValueToGenericContext(&context, "", nullptr, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "a", nullptr, 4, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, nullptr, "abcd", 4, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, nullptr, nullptr, 4, 0), 1);
  RefuseAllocation(1);
  EXPECT_EQ(AddSingleValueToGenericContext(&context, "", "a", 1), 0);
  RefuseAllocation(0);
  EXPECT_EQ(Entries(context).count, 0U);
  // The parser keeps the low 32 bits of the size.
  EXPECT_EQ(KVRMSPParseBufferToCxt(&context, Stream(kMSP, "4096:4 5 4096:4 6").data(), 0x500000008),
            1U);
  ReleaseGenericParserCxt(&context);
}

TEST(ParserContextTest, CutsNamesAt98Characters) {
  std::vector<uint64_t> values(65535);  // of 1 to 64 bits; no array may have more
  std::mt19937_64 random(1);
  std::ranges::generate(values, [&] { return random() >> random() % 64; });
  for (const size_t length : {93U, 94U, 95U, 97U, 98U, 99U, 120U}) {
    const std::string name(length, 'n');
    const std::string prefix(90, 'a');
    GenericParserCxt context = {};
    AddSingleValueToGenericContext(&context, prefix.c_str(), name.c_str(), 0);
    AddMultipleFieldsToGenericContext(&context, name.c_str(), values.data(), 8, 65535);
    std::string expected = (prefix + name).substr(0, 98) + "=0 ";
    for (size_t i = 0; i < values.size(); ++i) {
      expected += (name + std::to_string(i)).substr(0, 98) + "=" + std::to_string(values[i]) + " ";
    }
    EXPECT_EQ(Entries(context).text, expected);
    ReleaseGenericParserCxt(&context);
  }
}

}  // namespace
