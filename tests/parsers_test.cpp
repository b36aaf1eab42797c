// The parser contexts, the three statistics parsers and their way through the exporter table.

#include <gtest/gtest.h>

#include <algorithm>
#include <barrier>
#include <fstream>
#include <set>
#include <sstream>
#include <thread>

#include "morwick/morwick.h"
#include "tests/entries.h"
#include "tests/fake_platform.h"
#include "tests/heap.h"

namespace {

enum Kind { kKVR, kFTL, kMSP };

// A stream from its notation: "4:1" is a header with key and length, "7" a value, "3..5" the values
// 3, 4 and 5, "'ab" the bytes a and b. Headers and values are as wide as the kind's.
std::string Stream(Kind kind, const std::string &notation) {
  std::string bytes;
  const size_t width = kind == kMSP ? 4 : 8;
  const auto put = [&](uint64_t number, size_t size) {
    for (size_t i = 0; i < size; ++i) bytes += static_cast<char>(number >> (8 * i));
  };
  std::istringstream tokens(notation);
  for (std::string token; tokens >> token;) {
    const size_t colon = token.find(':');
    const size_t dots = token.find("..");
    if (token[0] == '\'') {
      bytes += token.substr(1);
    } else if (colon != std::string::npos) {
      put(std::stoull(token, nullptr, 0), width / 2);
      put(std::stoull(token.substr(colon + 1), nullptr, 0), width / 2);
    } else {
      const uint64_t first = std::stoull(token, nullptr, 0);
      const uint64_t last = dots == std::string::npos ? first : std::stoull(token.substr(dots + 2));
      for (uint64_t value = first; value <= last; ++value) put(value, width);
    }
  }
  return bytes;
}

template <typename Context>
std::string TextOf(const Context &context) {
  const Entries entries(context);
  EXPECT_TRUE(entries.sound) << entries.text;
  return entries.text;
}

std::string TakeMessage() {
  std::string message = GetAPIErrorMessage();
  std::free(GlobalAPIErrorMessage);
  GlobalAPIErrorMessage = nullptr;
  return message;
}

// Parses once, into a context that holds an entry already when `filled`; the allocation with the
// number `refused` fails. Everything that can be seen afterwards, as text; nothing is left behind.
std::string Parse(Kind kind, const std::string &bytes, bool filled = false, size_t shift = 0,
                  size_t refused = 0) {
  const ExactBuffer buffer(bytes, shift);
  const auto size = static_cast<uint32_t>(bytes.size());
  GenericParserCxt generic = {};
  KVRStatsCxt kvr = {};
  kvr.exportVersion = 99;
  if (filled) {
    EXPECT_EQ(KVRParseBufferToCxt(&kvr, Stream(kKVR, "8:1 1").data(), 16), 1);
    EXPECT_EQ(AddSingleValueToGenericContext(&generic, "valid", "Lbas", 1), 1);
  }
  RefuseAllocation(refused);
  uint64_t result = 0;
  switch (kind) {
    case kKVR:
      result = KVRParseBufferToCxt(&kvr, buffer.data(), size) == 1 ? 1 : 0;
      break;
    case kFTL:
      result = KVRFTLParseBufferToCxt(&generic, buffer.data(), size);
      break;
    case kMSP:
      result = KVRMSPParseBufferToCxt(&generic, buffer.data(), size);
      break;
  }
  RefuseAllocation(0);
  std::string seen = kind == kKVR ? TextOf(kvr) : TextOf(generic);
  seen += "-> " + std::to_string(result);
  if (kvr.exportVersion != 99) seen += ", version " + std::to_string(kvr.exportVersion);
  if (const std::string message = TakeMessage(); message != "NA") seen += ", " + message;
  EXPECT_EQ(kvr.parseMarker, kind == kKVR || filled ? -1 : 0);
  KVRReleaseContext(&kvr);
  const auto *record = reinterpret_cast<const char *>(&kvr);
  EXPECT_EQ(std::count(record, record + sizeof kvr, '\0'), static_cast<long>(sizeof kvr));
  ReleaseGenericParserCxt(&generic);
  ReleaseGenericParserCxt(&generic);
  EXPECT_EQ(TextOf(generic), "");
  return seen;
}

const std::string kFTL14 = "KVRFTLParseBufferToCxt: hostWriteLogHisto(14): ";
const std::string kInvalid = "KVRMSPParseBufferToCxt: Passed in invalid buffer or empty buffer";

TEST(ParsersTest, ReadGoodAndBadStreams) {
  std::ifstream cases(CASES "/streams.txt");
  int count = 0;
  for (std::string line; std::getline(cases, line); ++count) {
    if (line.empty() || line.starts_with('#')) continue;
    SCOPED_TRACE(line);
    const Kind kind = line.starts_with("KVR") ? kKVR : line.starts_with("FTL") ? kFTL : kMSP;
    const size_t bar = line.find(" | ");
    const size_t secondBar = line.find(" | ", bar + 1);
    const std::string bytes = Stream(kind, line.substr(bar + 3, secondBar - bar - 3));
    const std::string seen = line.substr(secondBar + 3);
    if (const size_t entry = line[3] == '!' ? std::stoul(line.substr(4)) : 0; entry > 0) {
      EXPECT_EQ(Parse(kind, bytes, false, 0, 2 * entry - 1), seen) << "no memory for the value";
      EXPECT_EQ(Parse(kind, bytes, false, 0, 2 * entry), seen) << "no memory for the name";
      continue;
    }
    EXPECT_EQ(Parse(kind, bytes), seen);
    EXPECT_EQ(Parse(kind, bytes, false, 1), seen) << "unaligned";
    EXPECT_EQ(Parse(kind, bytes, true), "validLbas=1 " + seen) << "into a context with an entry";
  }
  EXPECT_GT(count, 60);
}

TEST(ParsersTest, TakeNullPointersAndHugeSizes) {
  GenericParserCxt generic = {};
  KVRStatsCxt kvr = {};
  const std::string array = Stream(kFTL, "14:10 1..10");
  const std::string hard = Stream(kMSP, "4096:4 5");
  EXPECT_EQ(KVRParseBufferToCxt(nullptr, array.data(), 88), 0);
  EXPECT_EQ(KVRParseBufferToCxt(&kvr, nullptr, 80), 0);
  KVRReleaseContext(nullptr);
  EXPECT_EQ(KVRFTLParseBufferToCxt(nullptr, Stream(kFTL, "1:1 5 14:1 1 1:1 5").data(), 48), 1U);
  EXPECT_EQ(TakeMessage(), "KVRFTLParseBufferToCxt: version(1) cannot add 1 element to context");
  EXPECT_EQ(KVRFTLParseBufferToCxt(nullptr, array.data(), 88), 0U);
  EXPECT_EQ(TakeMessage(), kFTL14 + "Cannot add 10 elements to context");
  EXPECT_EQ(KVRFTLParseBufferToCxt(&generic, nullptr, 80), 0U);
  EXPECT_EQ(KVRMSPParseBufferToCxt(nullptr, hard.data(), 8), 0U);
  EXPECT_EQ(TakeMessage(),
            "KVRMSPParseBufferToCxt: passWithTmodeHard(4096): Error adding 1 elements to context");
  EXPECT_EQ(KVRMSPParseBufferToCxt(&generic, nullptr, 80), 0U);
  EXPECT_EQ(TakeMessage(), kInvalid);
  EXPECT_EQ(KVRMSPParseBufferToCxt(&generic, hard.data(), 0x500000000), 0U);
  EXPECT_EQ(TakeMessage(), kInvalid);
  EXPECT_EQ(AddSingleValueToGenericContext(nullptr, "", "a", 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(nullptr, "a", "1234", 4, 1), 0);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(nullptr, "a", "1234", 0, 1), 1);
  EXPECT_EQ(AddMultipleFieldsToGenericContext(&generic, "a", nullptr, 4, 1), 0);
  EXPECT_EQ(TextOf(generic), "");
  ReleaseGenericParserCxt(nullptr);
  EXPECT_EQ(KVRMSPParseBufferToCxt(&generic, hard.data(), 0x500000008), 1U);
  ReleaseGenericParserCxt(&generic);
}

TEST(ParserContextTest, AddsLittleEndianElementsOfAnyWidth) {
  const ExactBuffer bytes("\xaa\xbb\xcc\xdd\xee\xff\x11\x22\x33");
  const struct {
    uint32_t width, count;
    int result;
    std::string entries;
  } cases[] = {{3, 1, 1, "f=13417386 "},
               {1, 3, 1, "f0=170 f1=187 f2=204 "},
               {2, 2, 1, "f0=48042 f1=56780 "},
               {8, 1, 1, "f=" + std::to_string(0x2211ffeeddccbbaa) + " "},
               {9, 1, 0, ""},
               {9, 2, 0, ""},
               {0, 5, 1, ""},
               {4, 0, 1, ""},
               {4, 65536, 0, ""}};
  for (const auto &[width, count, result, entries] : cases) {
    GenericParserCxt context = {};
    EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "f", bytes.data(), width, count), result);
    EXPECT_EQ(TextOf(context), entries);
    ReleaseGenericParserCxt(&context);
  }
}

TEST(ParserContextTest, DropsTheEntryThatMemoryIsRefusedFor) {
  for (size_t refused = 1; refused <= 6; ++refused) {
    GenericParserCxt context = {};
    RefuseAllocation(refused);
    EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "f", "123", 1, 3), 0);
    RefuseAllocation(refused);
    EXPECT_EQ(AddSingleValueToGenericContext(&context, "", "g", 1), refused <= 2 ? 0 : 1);
    RefuseAllocation(0);
    const std::string seen[] = {"f1=50 f2=51 ", "f0=49 f2=51 g=1 ", "f0=49 f1=50 g=1 "};
    EXPECT_EQ(TextOf(context), seen[(refused - 1) / 2]);
    ReleaseGenericParserCxt(&context);
  }
}

TEST(ParserContextTest, CutsNamesAt98Characters) {
  const std::string a90(90, 'a');
  const std::string bytes(12345, 1);
  for (const size_t length : {95U, 96U, 97U, 98U, 99U, 120U}) {
    const std::string name(length, 'n');
    GenericParserCxt context = {};
    EXPECT_EQ(AddSingleValueToGenericContext(&context, a90.c_str(), name.c_str(), 0), 1);
    EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, name.c_str(), bytes.data(), 1, 12345), 1);
    std::string expected = (a90 + name).substr(0, 98) + "=0 ";
    for (int i = 0; i < 12345; ++i) {
      expected += (name + std::to_string(i)).substr(0, 98) + "=1 ";
    }
    EXPECT_EQ(TextOf(context), expected);
    ReleaseGenericParserCxt(&context);
  }
}

// TextOf checks each text against its value.
TEST(ParserContextTest, WritesEveryMagnitude) {
  GenericParserCxt context = {};
  for (uint64_t power = 1;; power *= 10) {
    for (const uint64_t value : {power - 1, power, power + 1, power / 7 * 5, ~power}) {
      EXPECT_EQ(AddSingleValueToGenericContext(&context, "", "v", value), 1);
    }
    if (power == 10000000000000000000U) break;
  }
  EXPECT_TRUE(TextOf(context).starts_with("v=0 v=1 v=2 "));
  ReleaseGenericParserCxt(&context);
}

TEST(ErrorMessageTest, KeepsTheFirstWholeMessage) {
  RefuseAllocation(1);
  SetAPIErrorMessage("no memory");
  RefuseAllocation(0);
  EXPECT_EQ(TakeMessage(), "NA");
  SetAPIErrorMessage("%s %d", "100%d", 7);
  SetAPIErrorMessage("second");
  EXPECT_EQ(TakeMessage(), "100%d 7");
  for (const size_t length : {1022U, 1023U, 1024U, 5000U}) {
    SetAPIErrorMessage("%s", std::string(length, 'x').c_str());
    EXPECT_EQ(TakeMessage().size(), std::min<size_t>(length, 1023));
  }
}

TEST(ErrorMessageTest, IsOneOfThoseThatEightThreadsReportAtOnce) {
  for (int round = 0; round < 50; ++round) {
    std::barrier start(8);
    std::vector<std::thread> threads;
    std::set<std::string> possible;
    const char *seen[8] = {};  // by each thread, once it has reported
    for (int i = 0; i < 8; ++i) {
      const int length = i < 3 ? i + 1 : i + 11;  // never the configured ten
      possible.insert(kFTL14 + "(#10) cfg elements != (" + std::to_string(length) +
                      ") buffer elements");
      threads.emplace_back([&start, seenHere = &seen[i], length] {
        const std::string bytes =
            Stream(kFTL, "14:" + std::to_string(length) + " 1.." + std::to_string(length));
        start.arrive_and_wait();
        GenericParserCxt context = {};
        KVRFTLParseBufferToCxt(&context, bytes.data(), static_cast<uint32_t>(bytes.size()));
        *seenHere = GetAPIErrorMessage();
        ReleaseGenericParserCxt(&context);
      });
    }
    for (std::thread &thread : threads) thread.join();
    for (const char *message : seen) EXPECT_EQ(message, GetAPIErrorMessage());
    EXPECT_TRUE(possible.contains(TakeMessage()));
  }
}

// A tool's whole way, with nothing named but the row.
TEST(BindingsTest, ServeAToolThroughTheRowAlone) {
  for (NandExporter *exporter = nand_exporters; exporter->className != nullptr; ++exporter) {
    fakePlatform.Reset({{"present", exporter->className}});
    KVRConnection connection = {};
    testing::internal::CaptureStdout();
    ASSERT_EQ(openKVRConnection(&connection), 1);
    testing::internal::GetCapturedStdout();
    ASSERT_EQ(connection.exporter, exporter);
    const NandExporter &row = *connection.exporter;
    KVRStatsCxt kvr = {};
    EXPECT_EQ(row.parseBufferToCxt(&kvr, Stream(kKVR, "4:1 7").data(), 16), 1);
    EXPECT_EQ(TextOf(kvr), "hostWrites=7 ");
    row.releaseContext(&kvr);
    GenericParserCxt generic = {};
    EXPECT_EQ(row.ftlParseBufferToCxt(&generic, Stream(kFTL, "1:1 5").data(), 16), 1U);
    const bool first = exporter == nand_exporters;
    uint32_t selector = 0;  // of all kinds in turn, as digits of a number
    for (const auto getter :
         {row.getStatsSelectors, row.getDefectsListSelectors, row.getTelemetryListSelectors,
          row.getTaskSchedulerSelectors, row.getSnapshotSelectors, row.getBandStatsSelectors}) {
      selector = selector * 40 + getter()->first;
      EXPECT_EQ(getter()->second, getter()->first);
    }
    EXPECT_EQ(selector, ((((13U * 40 + 15) * 40 + 17) * 40 + 39) * 40 + 22) * 40 + 11);
    EXPECT_EQ(row.getSnapshotHeaderSelectors()->second, 145U);
    EXPECT_EQ(row.getMSPStatsSelectors != nullptr, first);
    EXPECT_EQ(row.mspParseBufferToCxt != nullptr, first);
    if (row.mspParseBufferToCxt != nullptr) {
      EXPECT_EQ(row.getMSPStatsSelectors()->second, 221U);
      EXPECT_EQ(row.mspParseBufferToCxt(&generic, Stream(kMSP, "4096:4 6").data(), 8), 1U);
    }
    EXPECT_EQ(TextOf(generic), first ? "version=5 passWithTmodeHard=6 " : "version=5 ");
    row.releaseGenericParserCxt(&generic);
    closeKVRConnection(&connection);
    EXPECT_TRUE(fakePlatform.openHandles.empty());
  }
}

}  // namespace
