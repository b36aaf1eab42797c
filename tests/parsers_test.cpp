// The parser contexts, the three statistics parsers and their way through the exporter table.

#include <gtest/gtest.h>

#include <algorithm>

#include "morwick/morwick.h"
#include "tests/fake_platform.h"
#include "tests/heap.h"

namespace {

// Buffers are written as records: key, length and values, little-endian as controllers send them.
template <typename Integer>
std::string Bytes(std::initializer_list<Integer> values) {
  std::string bytes;
  for (const Integer value : values) {
    for (size_t i = 0; i < sizeof value; ++i) bytes += static_cast<char>(value >> (8 * i));
  }
  return bytes;
}

std::string Words(std::initializer_list<uint64_t> values) { return Bytes(values); }

std::string Header(uint32_t key, uint32_t length) { return Bytes({key, length}); }

std::string MSPRecord(uint16_t key, const std::string &payload) {
  return Bytes({key, static_cast<uint16_t>(payload.size())}) + payload;
}

std::string Numbers(uint64_t first, uint64_t count) {
  std::string bytes;
  for (uint64_t i = 0; i < count; ++i) bytes += Words({first + i});
  return bytes;
}

// "name=value " for each entry, after checking what must hold for any context.
template <typename Context>
std::string Entries(const Context &context) {
  std::string text;
  const ContextNode *name = context.namesHead;
  const ContextNode *value = context.valuesHead;
  const ContextNode *lastName = nullptr;
  const ContextNode *lastValue = nullptr;
  for (; name != nullptr && value != nullptr; name = name->next, value = value->next) {
    EXPECT_EQ(value->text, std::to_string(value->value));
    EXPECT_EQ(name->value, 0U);
    text += std::string(name->text) + "=" + value->text + " ";
    lastName = name;
    lastValue = value;
  }
  EXPECT_TRUE(name == nullptr && value == nullptr) << "one list is longer";
  EXPECT_EQ(context.namesTail, lastName);
  EXPECT_EQ(context.valuesTail, lastValue);
  return text;
}

// "name0=first name1=first+1 ..."
std::string Elements(const std::string &name, int count, uint64_t first) {
  std::string text;
  for (int i = 0; i < count; ++i) {
    text += name + std::to_string(i) + "=" + std::to_string(first + static_cast<uint64_t>(i)) + " ";
  }
  return text;
}

std::string TakeMessage() {
  std::string message = GetAPIErrorMessage();
  std::free(GlobalAPIErrorMessage);
  GlobalAPIErrorMessage = nullptr;
  return message;
}

enum StreamKind { kKVR, kFTL, kMSP };

struct Parsed {
  std::string entries;
  uint64_t result = 0;
  std::string message;
  uint32_t exportVersion = 0;
};

bool operator==(const Parsed &a, const Parsed &b) {
  return a.entries == b.entries && a.result == b.result && a.message == b.message &&
         a.exportVersion == b.exportVersion;
}

void PrintTo(const Parsed &parsed, std::ostream *out) {
  *out << "result " << parsed.result << ", message " << parsed.message << ", exportVersion "
       << parsed.exportVersion << ", entries " << parsed.entries;
}

// Parses once, into a context that holds an entry already when `filled`; the allocation with the
// number `refused` fails. Nothing is left behind.
Parsed Parse(StreamKind kind, const std::string &bytes, bool filled = false, size_t shift = 0,
             size_t refused = 0) {
  const ExactBuffer buffer(bytes, shift);
  const auto size = static_cast<uint32_t>(bytes.size());
  GenericParserCxt generic = {};
  KVRStatsCxt kvr = {};
  kvr.exportVersion = 99;
  if (filled) {
    EXPECT_EQ(KVRParseBufferToCxt(&kvr, Words({8 | 1ULL << 32, 1}).data(), 16), 1);
    EXPECT_EQ(AddSingleValueToGenericContext(&generic, "valid", "Lbas", 1), 1);
  }
  Parsed parsed;
  RefuseAllocation(refused);
  switch (kind) {
    case kKVR:
      parsed.result = static_cast<uint64_t>(KVRParseBufferToCxt(&kvr, buffer.data(), size));
      break;
    case kFTL:
      parsed.result = KVRFTLParseBufferToCxt(&generic, buffer.data(), size);
      break;
    case kMSP:
      parsed.result = KVRMSPParseBufferToCxt(&generic, buffer.data(), size);
      break;
  }
  RefuseAllocation(0);
  parsed.message = TakeMessage();
  parsed.entries = kind == kKVR ? Entries(kvr) : Entries(generic);
  if (kind == kKVR) {
    EXPECT_EQ(kvr.parseMarker, -1);
    parsed.exportVersion = kvr.exportVersion;
  }
  KVRReleaseContext(&kvr);
  const auto *record = reinterpret_cast<const char *>(&kvr);
  EXPECT_EQ(std::count(record, record + sizeof kvr, '\0'), static_cast<long>(sizeof kvr));
  ReleaseGenericParserCxt(&generic);
  ReleaseGenericParserCxt(&generic);
  EXPECT_EQ(Entries(generic), "");
  return parsed;
}

struct StreamCase {
  std::string bytes;
  Parsed expected;
};

void Check(StreamKind kind, const std::vector<StreamCase> &cases) {
  for (const auto &[bytes, expected] : cases) {
    SCOPED_TRACE(testing::Message() << "case " << &bytes - &cases[0].bytes << ", kind " << kind);
    EXPECT_EQ(Parse(kind, bytes), expected);
    EXPECT_EQ(Parse(kind, bytes, false, 1), expected) << "unaligned";
    Parsed after = expected;
    after.entries.insert(0, "validLbas=1 ");
    EXPECT_EQ(Parse(kind, bytes, true), after) << "into a context with an entry";
  }
}

const std::string kHostWrites = Header(4, 1) + Words({1000});

TEST(KVRParserTest, ReadsGoodAndBadStreams) {
  const uint64_t big = 0xffffffff00000007;
  std::vector<StreamCase> cases = {
      {Header(0, 0) + "1234", {"", 1, "NA", 99}},
      {kHostWrites, {"hostWrites=1000 ", 1, "NA", 99}},
      {kHostWrites + "1234567", {"hostWrites=1000 ", 1, "NA", 99}},
      {Header(53, 1) + Words({big}), {"exportVersion=18446744069414584327 ", 1, "NA", 7}},
      {Header(53, 1) + Words({5}) + Header(0x30000001, 0), {"exportVersion=5 ", 0, "NA", 0}},
      {Header(53, 1) + Words({5}) + Header(0x30000000, 0), {"exportVersion=5 ", 1, "NA", 5}},
      {kHostWrites + Header(4, 1), {"hostWrites=1000 ", 0, "NA", 0}},
      {kHostWrites + Header(700, 3) + Words({1, 2}), {"hostWrites=1000 ", 0, "NA", 0}},
      {Header(700, 0xffffffff) + Words({1, 2}), {"", 0, "NA", 0}},
      {Header(0, 2) + Words({4, 4}) + Header(660, 1) + Words({4}) + Header(0xffff, 0) + kHostWrites,
       {"hostWrites=1000 ", 1, "NA", 99}},
      {kHostWrites + Header(4, 1) + Words({2}), {"hostWrites=1000 hostWrites=2 ", 1, "NA", 99}},
      {Header(4, 3) + Words({1, 2, 3}) + kHostWrites,
       {"hostWrites=1 hostWrites=1000 ", 1, "NA", 99}},
      // A record that is shorter than its key takes the words behind it, if there are enough.
      {Header(4, 0) + Header(700, 0), {"hostWrites=700 ", 1, "NA", 99}},
      {Header(4, 0), {"", 1, "NA", 99}},
      {Header(265, 1) + Words({1}) + Header(700, 2) + Words({2, 3}), {"", 1, "NA", 99}},
      {Header(265, 1) + Words({1}) + Header(700, 3) + Words({2, 3, 4}),
       {"readCountHisto0=1 readCountHisto1=12884902588 readCountHisto2=2 readCountHisto3=3 "
        "readCountHisto4=4 ",
        1, "NA", 99}},
      {Header(90, 160) + Numbers(5, 160), {Elements("qosPerCmdQ", 160, 5), 1, "NA", 99}},
  };
  for (size_t size = 0; size < 8; ++size)
    cases.push_back({std::string(size, 1), {"", 0, "NA", 99}});
  Check(kKVR, cases);
}

TEST(KVRParserTest, KeepsSummaryFields) {
  std::string bytes;
  const uint32_t keys[] = {4, 7, 12, 13, 17, 18, 19, 20, 28, 45, 48, 49, 50, 51, 52, 53, 56, 265};
  for (const uint32_t key : keys) {
    const uint32_t count = key == 265 ? 5 : 1;
    bytes += Header(key, count) + Numbers(0x100000000 + key, count);
  }
  KVRStatsCxt c = {};
  ASSERT_EQ(KVRParseBufferToCxt(&c, bytes.data(), static_cast<uint32_t>(bytes.size())), 1);
  const uint64_t wide[] = {c.hostWrites,          c.hostReads,
                           c.IND_pool_free,       c.IND_pool_count,
                           c.wearLevMoves,        c.nandWrites,
                           c.nandReads,           c.bandErases,
                           c.numSleepOps,         c.maxHighEnduranceBlockErases,
                           c.numFreeVirtualBlocks};
  for (size_t i = 0; i < std::size(wide); ++i) EXPECT_EQ(wide[i], 0x100000000 + keys[i]);
  const uint32_t narrow[] = {c.bytesPerPage, c.pagesPerVirtualBlock, c.blocksPerVirtualBlock,
                             c.numVirtualBlocks, c.exportVersion};
  for (size_t i = 0; i < std::size(narrow); ++i) EXPECT_EQ(narrow[i], keys[11 + i]);
  EXPECT_EQ(c.utilFormatTime, 0x100000000 + 56);
  for (uint64_t i = 0; i < 5; ++i) EXPECT_EQ(c.readCountHisto[i], 0x100000000 + 265 + i);
  KVRReleaseContext(&c);
}

const std::string kVersion = Header(1, 1) + Words({5});
const std::string kFTL14 = "KVRFTLParseBufferToCxt: hostWriteLogHisto(14): ";

TEST(FTLParserTest, ReadsGoodAndBadStreams) {
  std::vector<StreamCase> cases = {
      {kVersion + Header(14, 10) + Numbers(3, 10) + "1234",
       {"version=5 " + Elements("hostWriteLogHisto_", 10, 3), 11, "NA"}},
      {Header(0xffff, 0) + Header(0x30000001, 0) + kVersion, {"version=5 ", 1, "NA"}},
      {kVersion + Header(0xffff, 1) + Words({1}) + kVersion, {"version=5 ", 1, "NA"}},
      {Header(0x30000000, 1) + Words({1}) + kVersion, {"version=5 ", 1, "NA"}},
      {Header(0x30000001, 1) + Words({1}) + kVersion, {"", 0, "NA"}},
      {kVersion + Header(1, 2) + Words({5}), {"version=5 ", 1, "NA"}},
      {kVersion + Header(1, 0xffffffff) + Words({5}), {"version=5 ", 1, "NA"}},
      {kVersion + Header(1, 1), {"version=5 ", 1, "NA"}},
      {Header(14, 12) + Numbers(3, 12) + kVersion,
       {Elements("hostWriteLogHisto_", 10, 3) + "version=5 ", 11,
        kFTL14 + "(#10) cfg elements != (12) buffer elements"}},
      {Header(14, 3) + Numbers(3, 3) + Header(15, 1) + Words({8}),
       {Elements("hostWriteLogHisto_", 3, 3) + "hostReadLogHisto_=8 ", 4,
        kFTL14 + "(#10) cfg elements != (3) buffer elements"}},
      {Header(1, 4) + Numbers(5, 4) + kVersion, {"version=5 version=5 ", 2, "NA"}},
      {Header(21, 1) + Words({1}) + Header(293, 1) + Words({1}) + Header(0, 1) + Words({1}) +
           Header(660, 1) + Words({1}) + Header(659, 1) + Words({2}),
       {"raidVerificationReads=2 ", 1, "NA"}},
  };
  for (size_t size = 0; size < 8; ++size) cases.push_back({std::string(size, 1), {"", 0, "NA"}});
  Check(kFTL, cases);
}

const std::string kHard = MSPRecord(4096, Bytes<uint32_t>({5}));

TEST(MSPParserTest, ReadsGoodAndBadStreams) {
  const std::string flips =
      "KVRMSPParseBufferToCxt: FS2decodedBitFlips(4120): cfg 11 elements; "
      "(11*4) cfg bytes != (";
  const std::string hard =
      "KVRMSPParseBufferToCxt: passWithTmodeHard(4096): cfg 1 elements; "
      "(1*4) cfg bytes != (";
  const std::string bytes8(8, 1);
  Check(kMSP,
        {
            {"", {"", 0, "KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer"}},
            {Bytes<uint32_t>({0, 0x1000}), {"", 0, "NA"}},
            {MSPRecord(0x2fff, "") + MSPRecord(0x2ffe, "") + kHard,
             {"passWithTmodeHard=5 ", 1, "NA"}},
            {kHard + MSPRecord(0x2fff, "1234") + kHard, {"passWithTmodeHard=5 ", 1, "NA"}},
            {kHard + MSPRecord(0x2ffe, bytes8) + kHard,
             {"passWithTmodeHard=5 passWithTmodeHard=5 ", 2, "NA"}},
            {kHard + Bytes<uint16_t>({0x2ffe, 9}) + bytes8, {"passWithTmodeHard=5 ", 1, "NA"}},
            {kHard + Bytes<uint16_t>({4096, 5}) + "1234", {"passWithTmodeHard=5 ", 1, "NA"}},
            {kHard + "1", {"passWithTmodeHard=5 ", 1, "NA"}},
            {kHard + "123", {"passWithTmodeHard=5 ", 1, "NA"}},
            {MSPRecord(4120, Bytes<uint32_t>({7, 8})) + kHard,
             {"FS2decodedBitFlips0=7 FS2decodedBitFlips1=8 passWithTmodeHard=5 ", 3,
              flips + "8) buffer bytes"}},
            {MSPRecord(4120, Bytes<uint32_t>({7}) + "123"),
             {"FS2decodedBitFlips=7 ", 1, flips + "7) buffer bytes"}},
            {MSPRecord(4096, Bytes<uint32_t>({9, 10})),
             {"passWithTmodeHard=9 ", 1, hard + "8) buffer bytes"}},
            {MSPRecord(4096, "12") + kHard, {"passWithTmodeHard=5 ", 1, hard + "2) buffer bytes"}},
            {MSPRecord(4169, bytes8) + MSPRecord(8192, bytes8) + MSPRecord(8215, bytes8) +
                 MSPRecord(0, bytes8) + MSPRecord(4095, bytes8) + MSPRecord(0xffff, bytes8) +
                 MSPRecord(8214, Bytes<uint32_t>({1, 2, 3, 4, 5})) + kHard,
             {Elements("active_time_hist", 5, 1) + "passWithTmodeHard=5 ", 6, "NA"}},
        });
}

TEST(MSPParserTest, UsesTheLow32BitsOfTheSize) {
  GenericParserCxt context = {};
  EXPECT_EQ(KVRMSPParseBufferToCxt(&context, kHard.data(), 0x500000000), 0U);
  EXPECT_EQ(TakeMessage(), "KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
  EXPECT_EQ(KVRMSPParseBufferToCxt(&context, kHard.data(), 0x500000000 + kHard.size()), 1U);
  ReleaseGenericParserCxt(&context);
}

TEST(ParsersTest, TakeNullPointers) {
  const auto size = [](const std::string &bytes) { return static_cast<uint32_t>(bytes.size()); };
  const std::string array = Header(14, 1) + Words({1});
  EXPECT_EQ(KVRParseBufferToCxt(nullptr, kHostWrites.data(), size(kHostWrites)), 0);
  KVRStatsCxt kvr = {};
  EXPECT_EQ(KVRParseBufferToCxt(&kvr, nullptr, 80), 0);
  KVRReleaseContext(nullptr);
  EXPECT_EQ(KVRFTLParseBufferToCxt(nullptr, (kVersion + array + kVersion).data(), 48), 1U);
  EXPECT_EQ(TakeMessage(), "KVRFTLParseBufferToCxt: version(1) cannot add 1 element to context");
  const std::string whole = Header(14, 10) + Numbers(1, 10);
  EXPECT_EQ(KVRFTLParseBufferToCxt(nullptr, whole.data(), size(whole)), 0U);
  EXPECT_EQ(TakeMessage(), kFTL14 + "Cannot add 10 elements to context");
  GenericParserCxt generic = {};
  EXPECT_EQ(KVRFTLParseBufferToCxt(&generic, nullptr, 80), 0U);
  EXPECT_EQ(KVRMSPParseBufferToCxt(nullptr, kHard.data(), kHard.size()), 0U);
  EXPECT_EQ(TakeMessage(),
            "KVRMSPParseBufferToCxt: passWithTmodeHard(4096): Error adding 1 elements to context");
  EXPECT_EQ(KVRMSPParseBufferToCxt(&generic, nullptr, 80), 0U);
  EXPECT_EQ(TakeMessage(), "KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
  EXPECT_EQ(AddSingleValueToGenericContext(nullptr, "", "a", 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(nullptr, "a", "1234", 4, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(nullptr, "a", "1234", 0, 1), 1);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&generic, "a", nullptr, 4, 1), 0);
  EXPECT_EQ(Entries(generic), "");
  ReleaseGenericParserCxt(nullptr);
}

// The entries without the one at `dropped`.
std::string Without(std::vector<std::string> entries, size_t dropped) {
  std::string text;
  for (size_t i = 0; i < entries.size(); ++i) {
    if (i != dropped) text += entries[i] + " ";
  }
  return text;
}

TEST(ParsersTest, LoseOneEntryWhenMemoryIsRefused) {
  // A scalar, an array of three and another scalar; two allocations each.
  const std::string stats =
      Header(1, 1) + Words({5}) + Header(93, 3) + Numbers(6, 3) + Header(4, 1) + Words({9});
  const std::string msp =
      kHard + MSPRecord(4139, Bytes<uint32_t>({6, 7, 8})) + MSPRecord(4135, Bytes<uint32_t>({9}));
  const auto clean = Parse(kFTL, stats);
  ASSERT_EQ(clean.result, 5U) << clean.entries;
  const auto names = [](const std::string &entries) {
    std::vector<std::string> list;
    std::istringstream stream(entries);
    for (std::string entry; stream >> entry;) list.push_back(entry);
    return list;
  };
  for (size_t refused = 1; refused <= 10; ++refused) {
    SCOPED_TRACE(testing::Message() << "allocation " << refused);
    const size_t entry = (refused - 1) / 2;
    for (const StreamKind kind : {kKVR, kFTL, kMSP}) {
      const std::string &bytes = kind == kMSP ? msp : stats;
      std::vector<std::string> entries = names(Parse(kind, bytes).entries);
      ASSERT_EQ(entries.size(), 5U);
      // Parsing goes on to the end of the array, and behind a scalar only in the FTL parser.
      const bool array = entry >= 1 && entry <= 3;
      if (array) entries.resize(4);
      if (!array && kind != kFTL) entries.resize(entry + 1);
      const Parsed parsed = Parse(kind, bytes, false, 0, refused);
      EXPECT_EQ(parsed.entries, Without(entries, entry));
      const uint64_t results[] = {0, array ? 1U : 5U, entry == 4 ? 4U : entry == 0 ? 0U : 1U};
      EXPECT_EQ(parsed.result, results[kind]);
      EXPECT_EQ(parsed.message != "NA", kind != kKVR) << parsed.message;
    }
  }
}

TEST(ParserContextTest, AddsLittleEndianElementsOfAnyWidth) {
  const ExactBuffer bytes("\xaa\xbb\xcc\xdd\xee\xff\x11\x22\x33");
  const struct {
    uint32_t width, count;
    int result;
    std::string entries;
  } cases[] = {
      {3, 1, 1, "f=13417386 "},
      {1, 3, 1, "f0=170 f1=187 f2=204 "},
      {2, 2, 1, "f0=48042 f1=56780 "},
      {8, 1, 1, "f=" + std::to_string(0x2211ffeeddccbbaa) + " "},
      {9, 1, 0, ""},
      {9, 2, 0, ""},
      {0, 5, 1, ""},
      {4, 0, 1, ""},
      {4, 65536, 0, ""},
  };
  for (const auto &[width, count, result, entries] : cases) {
    GenericParserCxt context = {};
    EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "f", bytes.data(), width, count), result);
    EXPECT_EQ(Entries(context), entries);
    ReleaseGenericParserCxt(&context);
  }
}

TEST(ParserContextTest, CutsNamesAt98Characters) {
  const std::string a90(90, 'a');
  for (const size_t length : {95U, 96U, 97U, 98U, 99U, 120U}) {
    const std::string name(length, 'n');
    GenericParserCxt context = {};
    const std::string bytes(12345, 1);
    EXPECT_EQ(AddSingleValueToGenericContext(&context, a90.c_str(), name.c_str(), 0), 1);
    EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, name.c_str(), bytes.data(), 1, 12345), 1);
    std::string expected = (a90 + name).substr(0, 98) + "=0 ";
    for (int i = 0; i < 12345; ++i) {
      expected += (name + std::to_string(i)).substr(0, 98) + "=1 ";
    }
    EXPECT_EQ(Entries(context), expected);
    ReleaseGenericParserCxt(&context);
  }
}

TEST(ParserContextTest, WritesEveryMagnitude) {
  GenericParserCxt context = {};
  std::string expected;
  const auto add = [&](uint64_t value) {
    EXPECT_EQ(AddSingleValueToGenericContext(&context, "", "v", value), 1);
    expected += "v=" + std::to_string(value) + " ";
  };
  for (uint64_t power = 1;; power *= 10) {
    for (const uint64_t value : {power - 1, power, power + 1, power / 7 * 5}) add(value);
    if (power == 10000000000000000000U) break;
  }
  add(~uint64_t{0});
  EXPECT_EQ(Entries(context), expected);
  ReleaseGenericParserCxt(&context);
}

TEST(ErrorMessageTest, KeepsTheFirstWholeMessage) {
  EXPECT_STREQ(GetAPIErrorMessage(), "NA");
  RefuseAllocation(1);
  SetAPIErrorMessage("no memory");
  RefuseAllocation(0);
  EXPECT_STREQ(GetAPIErrorMessage(), "NA");
  SetAPIErrorMessage("%s %d", "100%d", 7);
  SetAPIErrorMessage("second");
  EXPECT_EQ(TakeMessage(), "100%d 7");
  for (const size_t length : {1022U, 1023U, 1024U, 5000U}) {
    SetAPIErrorMessage("%s", std::string(length, 'x').c_str());
    EXPECT_EQ(TakeMessage().size(), std::min<size_t>(length, 1023));
  }
}

// A tool's whole way, with nothing named but the row.
TEST(BindingsTest, ServeAToolThroughTheRowAlone) {
  for (const char *className :
       {"VeltoQRN3NVMeController", "VeltoEmbeddedNVMeController", "KVRStorage"}) {
    fakePlatform = FakePlatform();
    fakePlatform.present = {className};
    KVRConnection connection = {};
    testing::internal::CaptureStdout();
    ASSERT_EQ(openKVRConnection(&connection), 1);
    testing::internal::GetCapturedStdout();
    const NandExporter &row = *connection.exporter;
    EXPECT_STREQ(row.className, className);

    KVRStatsCxt kvr = {};
    EXPECT_EQ(row.parseBufferToCxt(&kvr, kHostWrites.data(), 16), 1);
    EXPECT_EQ(Entries(kvr), "hostWrites=1000 ");
    row.releaseContext(&kvr);

    GenericParserCxt ftl = {};
    EXPECT_EQ(row.ftlParseBufferToCxt(&ftl, kVersion.data(), 16), 1U);
    EXPECT_EQ(Entries(ftl), "version=5 ");
    row.releaseGenericParserCxt(&ftl);

    EXPECT_EQ(row.mspParseBufferToCxt != nullptr, row.getMSPStatsSelectors != nullptr);
    EXPECT_EQ(row.mspParseBufferToCxt != nullptr, connection.exporter == nand_exporters);
    if (row.mspParseBufferToCxt != nullptr) {
      GenericParserCxt msp = {};
      EXPECT_EQ(row.mspParseBufferToCxt(&msp, kHard.data(), 8), 1U);
      EXPECT_EQ(Entries(msp), "passWithTmodeHard=5 ");
      row.releaseGenericParserCxt(&msp);
    }
    closeKVRConnection(&connection);
    EXPECT_TRUE(fakePlatform.openHandles.empty());
  }
}

}  // namespace
