// Statistics, snapshot and snapshot header of a made-up controller. It was first powered on at a
// fixed time, and all values follow from the time since then. Its load rises and falls once a
// minute. All numbers are little-endian. It has its own copies of keys and columns, so that tests
// notice a wrong one in the library.

#include "platform/simulated/own_buffers.h"

#include <endian.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cmath>
#include <limits>
#include <numbers>
#include <numeric>
#include <span>
#include <string_view>

#include "platform/simulated/scenario.h"

namespace simulated {
namespace {

constexpr uint64_t kFirstPowerOn = 1704067200;  // 2024, in seconds since 1970
constexpr uint64_t kHour = 3'600'000;           // in milliseconds
constexpr uint64_t kMinute = 60'000;
constexpr uint64_t kHoursAMonth = 730;
constexpr double kSwing = 5'000;

// The value at the first power-on, and how much each hour of the clock, each hour of work or each
// month adds. An array is a histogram: each element has half the value of the element before it.
enum Pace { kByLoad, kByClock, kByMonth };
struct Counter {
  uint32_t id;
  uint32_t elementCount;
  uint64_t start;
  uint64_t growth;
  Pace pace = kByLoad;
};

// clang-format off: one row a line
constexpr Counter kStatistics[] = {
    {53, 1, 5, 0},                           // export version
    {52, 1, 4096, 0},                        // virtual blocks,
    {51, 1, 8, 0},                           // blocks in each,
    {50, 1, 1152, 0},                        // pages in each of these,
    {49, 1, 16384, 0},                       // bytes in each of these
    {48, 1, 312, 0},                         // free virtual blocks
    {12, 1, 870, 0},                         // indirection pool, free
    {13, 1, 1024, 0},                        // indirection pool
    {56, 1, kFirstPowerOn, 0},               // time of formatting
    {57, 1, kFirstPowerOn, 3600, kByClock},  // calendar time
    {34, 1, 0, 1, kByClock},                 // hours powered on
    {10, 1, 3, 0},                           // boots
    {4, 1, 20'000'000, 3'168'000},           // host writes, 4k sectors
    {7, 1, 50'000'000, 7'488'000},           // host reads
    {18, 1, 30'000'000, 4'752'000},          // NAND writes
    {19, 1, 60'000'000, 9'072'000},          // NAND reads
    {20, 1, 814, 129},                       // band erases
    {17, 1, 6, 2},                           // wear-level moves
    {45, 1, 12, 1},                          // erases of the block that had most of them
    {47, 1, 7, 1, kByMonth},                 // blocks that went bad
    {28, 1, 40, 30},                         // sleeps
    {14, 10, 4'000'000, 600'000},            // host writes by size
    {15, 10, 9'000'000, 900'000},            // host reads by size
    {265, 5, 70'000, 9'000},                 // read counts
};

constexpr Counter kMspStatistics[] = {
    {4096, 1, 900'000, 40'000},  // reads that passed at once
    {4104, 1, 7'000, 300},       // reads that passed after an acquisition
    {4127, 10, 900, 2},          // bit flips decoded
    {4137, 1, 3, 0},             // reads that failed
    {8200, 1, 4, 0},             // throttling
    {8202, 1, 2, 0},             // firmware updates
    {8212, 4, 64, 0},            // open blocks
    {8213, 6, 5'000, 60},        // random read hits
    {8214, 5, 0, 3'600},         // active time
};

// Where the columns of a snapshot's interval are, and how each is printed.
enum Kind : uint16_t { kPlain = 1, kThousandths = 2, kPriorities = 3 };
struct Column {
  Kind kind;
  uint32_t offset;
  std::string_view format;
};
constexpr uint32_t kIntervalSize = 252;
constexpr uint32_t kPriorityCount = 4;
constexpr uint32_t kOperationsSize = 12;  // count, total latency, maximum latency
constexpr Column kColumns[] = {
    {kPlain, 0, "T=%04u"},
    {kPlain, 104, " E=%02u"},
    {kPlain, 108, " HR=%4u"},
    {kPlain, 112, " HW=%4u"},
    {kPlain, 116, " NR=%4u"},
    {kPlain, 120, " NW=%4u"},
    {kThousandths, 156, " TH=%8u.%02u"},
    {kPlain, 124, " GC=%4u"},
    {kPlain, 132, " W=%2u"},
    {kPlain, 144, " BI=%3u"},
    {kPlain, 148, " BU=%3u"},
    {kPlain, 180, " V=%5u"},
    {kPlain, 188, " BF=%2u"},
    {kPlain, 192, "/%2u"},
    {kPlain, 4, " P=%2u"},
    {kPlain, 164, " H=%2u"},
    {kPlain, 160, "/%2u"},
    {kPlain, 200, " X=%2u"},
    {kPlain, 204, "/%2u"},
    {kPlain, 172, " L=%3u"},
    {kPlain, 176, "/%3u"},
    {kPlain, 212, " C=%2u"},
    {kPlain, 216, "/%2u"},
    {kPlain, 168, " S=%4u"},
    {kPlain, 208, " U=%8u"},
    {kPriorities, 56, " R%s="},
    {kPriorities, 8, " W%s="},
};
// clang-format on

constexpr uint32_t kIntervalCount = 120;
constexpr std::string_view kHeaderText{"Simulated controller\0\0\0\0", 24};
constexpr size_t kFormatSize = 16;

// A reply that is cut where its room ends.
class Reply {
 public:
  Reply(void *bytes, size_t room) : bytes_(static_cast<char *>(bytes)), room_(room) {}

  size_t size() const { return size_; }
  void Append(std::string_view bytes) { size_ += bytes.copy(bytes_ + size_, room_ - size_); }
  void Append(uint16_t number) { AppendBytes(htole16(number)); }
  void Append(uint32_t number) { AppendBytes(htole32(number)); }
  void Append(uint64_t number) { AppendBytes(htole64(number)); }

 private:
  template <typename Number>
  void AppendBytes(Number number) {
    Append({reinterpret_cast<const char *>(&number), sizeof number});
  }

  char *bytes_;
  size_t room_;
  size_t size_ = 0;
};

// The place of a time (in milliseconds) within the load's minute, as an angle.
double PhaseAt(uint64_t time) {
  return 2 * std::numbers::pi * static_cast<double>(time % kMinute) / kMinute;
}

// The time that drives most counters. It is up to five seconds before or after the clock and never
// goes back. The load is how much of it passes in a second.
uint64_t BusyTime(uint64_t time) {
  return time + static_cast<uint64_t>(std::llround(kSwing * std::sin(PhaseAt(time))));
}

// The load at a time, 1 on average: the derivative of BusyTime.
double LoadAt(uint64_t time) {
  return 1 + 2 * std::numbers::pi * kSwing / kMinute * std::cos(PhaseAt(time));
}

// Multiplies whole hours and the rest separately: growth times milliseconds could exceed 64 bits.
uint64_t ElementAt(const Counter &counter, uint32_t element, uint64_t clock) {
  uint64_t time = counter.pace == kByLoad ? BusyTime(clock) : clock;
  if (counter.pace == kByMonth) time /= kHoursAMonth;
  const uint64_t grown = time / kHour * counter.growth + time % kHour * counter.growth / kHour;
  return (counter.start + grown) >> element;
}

// Appends a record for each counter: id and length as `Half` of a header each, the length in units
// of so many bytes. Counters stop at the largest `Value`.
template <typename Half, typename Value, size_t kLengthUnit>
void AppendCounters(std::span<const Counter> counters, uint64_t time, Reply *reply) {
  for (const Counter &counter : counters) {
    reply->Append(static_cast<Half>(counter.id));
    reply->Append(static_cast<Half>(counter.elementCount * sizeof(Value) / kLengthUnit));
    for (uint32_t i = 0; i < counter.elementCount; ++i) {
      constexpr uint64_t kLargest = std::numeric_limits<Value>::max();
      reply->Append(static_cast<Value>(std::min(ElementAt(counter, i, time), kLargest)));
    }
  }
}

constexpr uint32_t kNotShown = 4'200'000'000;

// The interval that ended in the given second. Writes are slow in eight seconds of each two
// minutes.
void AppendInterval(uint32_t second, Reply *reply) {
  // Words without a column get values that no column has, so that a wrong offset is seen.
  std::array<uint32_t, kIntervalSize / sizeof(uint32_t)> interval;
  std::iota(interval.begin(), interval.end(), kNotShown);
  const auto set = [&](uint32_t offset, uint32_t value) { interval[offset / 4] = value; };
  const uint32_t noise = second * 2654435761U >> 28;  // 0 to 15
  const auto load = static_cast<uint32_t>(70 * LoadAt(uint64_t{second} * 1000)) + noise;
  const uint32_t slowness = second % 120 < 8 ? 10 : 1;
  const auto setOperations = [&](uint32_t offset, uint32_t count, uint32_t latency) {
    set(offset, count);
    set(offset + 4, count * latency);
    set(offset + 8, 9 * latency);
  };
  for (uint32_t priority = 0; priority < kPriorityCount; ++priority) {
    const uint32_t place = priority * kOperationsSize;
    setOperations(8 + place, 3 * load >> priority, (90 + noise) * slowness);
    setOperations(56 + place, 7 * load >> priority, 60 + noise + 5 * slowness);
  }
  const uint32_t hostReads = 26 * load;
  const uint32_t hostWrites = 11 * load;
  const uint32_t collected = hostWrites / 2;
  set(0, second);
  set(4, 5 * slowness);
  set(104, second % 28 == 0 ? 1 : 0);
  set(108, hostReads);
  set(112, hostWrites);
  set(116, hostReads + collected);
  set(120, hostWrites + collected);
  set(124, collected);
  set(132, second % 60 == 0 ? 1 : 0);
  set(144, 3 + noise % 4);
  set(148, 16 + noise % 3);
  set(156, 1230 * slowness + 10 * noise);
  set(160, slowness / 4);
  set(164, slowness - 1);
  set(168, 312 - noise);
  set(172, 2 * slowness);
  set(176, 10);
  set(180, 5120 - load);
  set(188, 4 + noise % 5);
  set(192, 12);
  set(200, noise);
  set(204, noise / 8);
  set(208, second % 10 == 0 ? 256 : 0);
  set(212, 1 + noise % 4);
  set(216, 16 + noise);
  for (const uint32_t word : interval) reply->Append(word);
}

void AppendSnapshot(uint64_t time, Reply *reply) {
  const auto last = static_cast<uint32_t>(time / 1000);
  for (uint32_t ago = kIntervalCount; ago-- > 0;) AppendInterval(last - ago, reply);
}

// Describes the snapshot. The last record that a header counts is never printed, so the header
// counts one record more than there are.
void AppendSnapshotHeader(Reply *reply) {
  constexpr uint32_t kVersion = 6;
  constexpr uint32_t kTextOffset = 36;
  constexpr uint32_t kColumnsOffset = kTextOffset + kHeaderText.size();
  for (const uint32_t word :
       {0U, kVersion, kIntervalSize, kIntervalCount + 1, 0U, 0U, kColumnsOffset, 0U, 0U}) {
    reply->Append(word);
  }
  reply->Append(kHeaderText);
  reply->Append(static_cast<uint64_t>(std::size(kColumns)));
  for (const auto &[kind, offset, format] : kColumns) {
    reply->Append(static_cast<uint32_t>(kind));
    reply->Append(offset);
    reply->Append(kind == kPriorities ? kPriorityCount * kOperationsSize : 4);
    std::array<char, kFormatSize> padded = {};
    format.copy(padded.data(), kFormatSize - 1);
    reply->Append({padded.data(), padded.size()});
  }
}

// Milliseconds since the first power-on. When the clock is set to an earlier time, the controller
// still has as many intervals as a snapshot holds.
uint64_t Now() {
  using std::chrono::milliseconds;
  const int64_t now =
      std::chrono::duration_cast<milliseconds>(std::chrono::system_clock::now().time_since_epoch())
          .count();
  constexpr auto kPowerOn = static_cast<int64_t>(kFirstPowerOn * 1000);
  constexpr int64_t kIntervals = int64_t{kIntervalCount} * 1000;
  return static_cast<uint64_t>(std::max(now - kPowerOn, kIntervals));
}

}  // namespace

std::optional<size_t> MakeOwnBuffer(uint32_t command, void *reply, size_t room) {
  Reply bounded(reply, room);
  switch (command) {
    case kReadStatistics:
      AppendCounters<uint32_t, uint64_t, 8>(kStatistics, Now(), &bounded);
      break;
    case kReadMsp: AppendCounters<uint16_t, uint32_t, 1>(kMspStatistics, Now(), &bounded); break;
    case kReadSnapshot: AppendSnapshot(Now(), &bounded); break;
    case kReadSnapshotHeader: AppendSnapshotHeader(&bounded); break;
    default: return std::nullopt;
  }
  return bounded.size();
}

}  // namespace simulated
