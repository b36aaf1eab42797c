// What the simulated controller makes up is good for every parser, at any time.

#include <sys/syscall.h>

#include <algorithm>
#include <cmath>
#include <ctime>
#include <functional>
#include <set>
#include <vector>

#include "morwick/morwick.h"
#include "tests/simulated/platform.h"

namespace {

int64_t wallClock = 0;  // in milliseconds since 1970; 0 for the real one

}  // namespace

// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name): the C library's are reserved
// Takes the place of the platform's, for the wall clock.
extern "C" MORWICK_EXPORT int clock_gettime(clockid_t clock, timespec *time) noexcept {
  if (clock != CLOCK_REALTIME || wallClock == 0) {
    return static_cast<int>(syscall(SYS_clock_gettime, clock, time));
  }
  *time = {.tv_sec = wallClock / 1000, .tv_nsec = wallClock % 1000 * 1'000'000};
  return 0;
}
// NOLINTEND(readability-inconsistent-declaration-parameter-name)

namespace {

std::vector<uint64_t> Values(const ContextNode *node) {
  std::vector<uint64_t> values;
  for (; node != nullptr; node = node->next) values.push_back(node->value);
  return values;
}

struct Statistics {
  std::vector<uint64_t> ftl, msp;
};

// What the controller makes of its statistics, through all three parsers.
Statistics CheckStatistics(uint32_t connection) {
  const std::string statistics = Read(connection, 9, 13);
  const std::string mspStatistics = Read(connection, 9, 221);
  const auto size = static_cast<uint32_t>(statistics.size());
  KVRStatsCxt kvr = {};
  GenericParserCxt ftl = {};
  GenericParserCxt msp = {};
  EXPECT_EQ(KVRParseBufferToCxt(&kvr, statistics.data(), size), 1);
  const uint32_t ftlCount = KVRFTLParseBufferToCxt(&ftl, statistics.data(), size);
  const uint64_t mspCount =
      KVRMSPParseBufferToCxt(&msp, mspStatistics.data(), mspStatistics.size());
  EXPECT_EQ(GlobalAPIErrorMessage, nullptr) << GlobalAPIErrorMessage;
  Statistics values = {.ftl = Values(ftl.valuesHead), .msp = Values(msp.valuesHead)};
  EXPECT_EQ(values.ftl.size(), ftlCount);
  EXPECT_EQ(values.msp.size(), mspCount);
  EXPECT_EQ(Values(kvr.valuesHead), values.ftl);
  for (int i = 1; i < 5; ++i) EXPECT_EQ(kvr.readCountHisto[i], kvr.readCountHisto[i - 1] / 2);
  KVRReleaseContext(&kvr);
  ReleaseGenericParserCxt(&ftl);
  ReleaseGenericParserCxt(&msp);
  return values;
}

// What the controller makes of its snapshot: sensible numbers, and by its header the same lines as
// in the fixed layout.
void CheckSnapshot(uint32_t connection, uint32_t lastSecond) {
  const std::string snapshot = Read(connection, 9, 22);
  const std::string header = Read(connection, 9, 145);
  std::string fixed(1 << 20, '\0');
  std::string described(1 << 20, '\0');
  uint64_t size = fixed.size();
  EXPECT_EQ(KVRParseSnapshotBuffer(snapshot.data(), snapshot.size(), fixed.data(), &size), 1U);
  fixed.resize(size);
  size = described.size();
  uint32_t state = 0;
  EXPECT_EQ(KVRParseSnapshotBufferWithInplaceParser(snapshot.data(), snapshot.size(),
                                                    described.data(), &size, header.data(), &state),
            1U);
  described.resize(size - 1);
  const std::string banner = "- KVR Snapshot - \nSimulated controller\n";
  EXPECT_EQ(described.substr(0, banner.size()), banner);
  EXPECT_EQ(fixed.substr(1337), described.substr(banner.size()) + "\n");
  // Words that no column is for begin so, each with an end of its own.
  EXPECT_EQ(fixed.find("42000000"), std::string::npos);

  std::vector<SnapshotRecord> records(120);
  ASSERT_EQ(snapshot.size(), records.size() * sizeof records[0]);
  snapshot.copy(reinterpret_cast<char *>(records.data()), snapshot.size());
  uint32_t second = lastSecond - 120;
  std::set<uint32_t> operations;
  for (const SnapshotRecord &record : records) {
    EXPECT_EQ(record.timestamp, ++second);
    const auto *words = reinterpret_cast<const uint32_t *>(&record);
    EXPECT_EQ(std::count_if(words + 1, words + sizeof record / 4,
                            [](uint32_t word) { return word < 1'000'000; }),
              63 - 1 - 14)
        << "words that a column is for, but for the timestamp";
    EXPECT_GE(record.nandReads, record.hostReads);
    EXPECT_GE(record.nandWrites, record.hostWrites);
    for (const auto &priorities : {record.reads, record.writes}) {
      for (const SnapshotOperations *each = priorities; each < priorities + 4; ++each) {
        EXPECT_GE(each->totalLatency, each->maxLatency);
        EXPECT_GT(each->maxLatency, 0U);
        operations.insert(each->count);
      }
    }
  }
  EXPECT_GT(operations.size(), 100U);
}

// At each time in turn: before the first power-on, two minutes after it, 100 ms apart, about a full
// hour, and when counters of 32 bits have come to their end.
TEST(SimulatedOwnBuffersTest, MakesWhatEveryParserUnderstands) {
  setenv("GRELLON_SCENARIO", "", 1);  // as if it were unset
  const uint32_t connection = Connect("VeltoQRN3NVMeController");
  const uint64_t powerOn = 1704067200000;
  Statistics before;
  uint64_t ageBefore = 0;
  for (const uint64_t time :
       {uint64_t{1}, powerOn + 120'000, powerOn + 120'100, powerOn + 3'599'999, powerOn + 3'600'000,
        uint64_t{8'000'000'000'000}}) {
    wallClock = static_cast<int64_t>(time);
    const uint64_t age = std::max(time, powerOn + 120'000) - powerOn;
    Statistics now = CheckStatistics(connection);
    CheckSnapshot(connection, static_cast<uint32_t>(age / 1000));
    EXPECT_EQ(now.ftl.at(9), (powerOn + age) / 1000) << "the calendar time";
    EXPECT_EQ(now.ftl.at(10), age / 3'600'000) << "the hours";
    EXPECT_EQ(now.ftl.at(19), 7 + age / 3'600'000 / 730) << "bad blocks, one more each month";
    const double angle = static_cast<double>(age % 60'000) / 60'000 * 2 * std::acos(-1);
    const uint64_t busy = age + static_cast<uint64_t>(std::llround(5000 * std::sin(angle)));
    EXPECT_EQ(now.msp.at(0), std::min<uint64_t>(900'000 + busy / 90, 4294967295));
    if (ageBefore != 0) {
      EXPECT_EQ(now.ftl != before.ftl, age > ageBefore);
      EXPECT_EQ(now.msp != before.msp, age > ageBefore);
      EXPECT_TRUE(std::ranges::equal(now.ftl, before.ftl, std::greater_equal()));
      EXPECT_TRUE(std::ranges::equal(now.msp, before.msp, std::greater_equal()));
    }
    before = std::move(now);
    ageBefore = age;
  }
  for (const uint32_t command : {13U, 221U, 22U, 145U}) {
    const uint32_t request[6] = {command};
    std::string reply(101, '#');
    size_t size = 99;
    EXPECT_EQ(CallStructMethod(connection, 9, request, sizeof request, reply.data(), &size), 0);
    EXPECT_EQ(size, 99U);
    EXPECT_EQ(reply, Read(connection, 9, command).substr(0, 99) + "##");
  }
  CloseService(connection);
}

}  // namespace
