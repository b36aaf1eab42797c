// Statistics, snapshot and snapshot header of a made-up controller. All values follow from its age,
// in milliseconds since a fixed first power-on. Its load rises and falls once a minute. All numbers
// are little-endian. Keys and columns are copied here, so that tests notice a wrong one in the
// library.

#include "platform/simulated/own_buffers.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <limits>
#include <numbers>
#include <numeric>
#include <span>
#include <string_view>

namespace simulated {
namespace {

constexpr uint64_t kFirstPowerOn = 1704067200;  // 2024, in seconds since 1970
constexpr uint64_t kHour = 3'600'000;           // in milliseconds
constexpr uint64_t kMinute = 60'000;            // in milliseconds
constexpr uint64_t kHoursAMonth = 730;
constexpr double kSwing = 5'000;  // the most that BusyTime and age differ, in milliseconds

// A value grows with each hour of BusyTime, hour of age or month of age.
enum Pace { kByLoad, kByClock, kByMonth };
struct Counter {
  uint32_t id;
  uint32_t elementCount;  // more than 1: a histogram; each element has half the value before it
  uint64_t start;         // the value at the first power-on
  uint64_t growth;        // in each hour or month
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

// A second of the controller's life.
struct Second {
  uint32_t number;    // seconds since the first power-on
  uint32_t noise;     // 0 to 15
  uint32_t load;      // about 77 on average
  uint32_t slowness;  // 1, or 10 in seconds when writes, and a little also reads, are slow

  uint32_t HostReads() const { return 26 * load; }
  uint32_t HostWrites() const { return 11 * load; }
  uint32_t Collected() const { return HostWrites() / 2; }
};

// A column of a snapshot. A snapshot has a record for each second.
enum Kind : uint16_t { kPlain = 1, kThousandths = 2, kPriorities = 3 };
struct Column {
  Kind kind;
  uint32_t offset;  // in the record, in bytes, as are the sizes and offsets below
  std::string_view format;
  uint32_t (*valueOf)(const Second &s) = nullptr;  // null by priority: AppendRecord sets those
};
constexpr uint32_t kRecordSize = 252;
constexpr uint32_t kPriorityCount = 4;
constexpr uint32_t kOperationsSize = 12;  // count, total latency, maximum latency
constexpr uint32_t kReadsOffset = 56;
constexpr uint32_t kWritesOffset = 8;
constexpr Column kColumns[] = {
    {kPlain, 0, "T=%04u", [](const Second &s) { return s.number; }},
    {kPlain, 104, " E=%02u", [](const Second &s) { return s.number % 28 == 0 ? 1U : 0U; }},
    {kPlain, 108, " HR=%4u", [](const Second &s) { return s.HostReads(); }},
    {kPlain, 112, " HW=%4u", [](const Second &s) { return s.HostWrites(); }},
    {kPlain, 116, " NR=%4u", [](const Second &s) { return s.HostReads() + s.Collected(); }},
    {kPlain, 120, " NW=%4u", [](const Second &s) { return s.HostWrites() + s.Collected(); }},
    {kThousandths, 156, " TH=%8u.%02u",
     [](const Second &s) { return 1230 * s.slowness + 10 * s.noise; }},
    {kPlain, 124, " GC=%4u", [](const Second &s) { return s.Collected(); }},
    {kPlain, 132, " W=%2u", [](const Second &s) { return s.number % 60 == 0 ? 1U : 0U; }},
    {kPlain, 144, " BI=%3u", [](const Second &s) { return 3 + s.noise % 4; }},
    {kPlain, 148, " BU=%3u", [](const Second &s) { return 16 + s.noise % 3; }},
    {kPlain, 180, " V=%5u", [](const Second &s) { return 5120 - s.load; }},
    {kPlain, 188, " BF=%2u", [](const Second &s) { return 4 + s.noise % 5; }},
    {kPlain, 192, "/%2u", [](const Second &) { return 12U; }},
    {kPlain, 4, " P=%2u", [](const Second &s) { return 5 * s.slowness; }},
    {kPlain, 164, " H=%2u", [](const Second &s) { return s.slowness - 1; }},
    {kPlain, 160, "/%2u", [](const Second &s) { return s.slowness / 4; }},
    {kPlain, 200, " X=%2u", [](const Second &s) { return s.noise; }},
    {kPlain, 204, "/%2u", [](const Second &s) { return s.noise / 8; }},
    {kPlain, 172, " L=%3u", [](const Second &s) { return 2 * s.slowness; }},
    {kPlain, 176, "/%3u", [](const Second &) { return 10U; }},
    {kPlain, 212, " C=%2u", [](const Second &s) { return 1 + s.noise % 4; }},
    {kPlain, 216, "/%2u", [](const Second &s) { return 16 + s.noise; }},
    {kPlain, 168, " S=%4u", [](const Second &s) { return 312 - s.noise; }},
    {kPlain, 208, " U=%8u", [](const Second &s) { return s.number % 10 == 0 ? 256U : 0U; }},
    {kPriorities, kReadsOffset, " R%s="},
    {kPriorities, kWritesOffset, " W%s="},
};
// clang-format on

constexpr uint32_t kRecordCount = 120;
// Filled with NULs to a whole number of 32-bit words.
constexpr std::string_view kHeaderText{"Simulated controller\0\0\0\0", 24};
constexpr size_t kFormatSize = 16;

template <typename Number>
void Append(Number number, std::string *buffer) {
  for (size_t i = 0; i < sizeof number; ++i) buffer->push_back(static_cast<char>(number >> 8 * i));
}

// The angle of an age within the minute in which the load rises and falls.
double PhaseAt(uint64_t age) {
  return 2 * std::numbers::pi * static_cast<double>(age % kMinute) / kMinute;
}

// Like the age, but it passes faster while the load is high. It never goes back.
uint64_t BusyTime(uint64_t age) {
  return age + static_cast<uint64_t>(std::llround(kSwing * std::sin(PhaseAt(age))));
}

// How fast BusyTime passes, 1 on average: the derivative of BusyTime.
double LoadAt(uint64_t age) {
  return 1 + 2 * std::numbers::pi * kSwing / kMinute * std::cos(PhaseAt(age));
}

// Multiplies whole hours and the rest separately: growth times milliseconds could exceed 64 bits.
uint64_t ElementAt(const Counter &counter, uint32_t element, uint64_t age) {
  uint64_t time = counter.pace == kByLoad ? BusyTime(age) : age;
  if (counter.pace == kByMonth) time /= kHoursAMonth;  // a month then counts as an hour
  const uint64_t grown = time / kHour * counter.growth + time % kHour * counter.growth / kHour;
  return (counter.start + grown) >> element;
}

// Appends a record for each counter. A header is two of `HeaderPart`: the id, and the length in
// units of kLengthUnit bytes. Counters stop at the largest `Value`.
template <typename HeaderPart, typename Value, size_t kLengthUnit>
void AppendCounters(std::span<const Counter> counters, uint64_t age, std::string *buffer) {
  for (const Counter &counter : counters) {
    Append(static_cast<HeaderPart>(counter.id), buffer);
    Append(static_cast<HeaderPart>(counter.elementCount * sizeof(Value) / kLengthUnit), buffer);
    for (uint32_t i = 0; i < counter.elementCount; ++i) {
      constexpr uint64_t kLargest = std::numeric_limits<Value>::max();
      Append(static_cast<Value>(std::min(ElementAt(counter, i, age), kLargest)), buffer);
    }
  }
}

constexpr uint32_t kNotShown = 4'200'000'000;  // larger than the value of any column

// The record of the second with that number. Writes are slow in eight seconds of each
// two minutes.
void AppendRecord(uint32_t number, std::string *buffer) {
  const uint32_t noise = number * 2654435761U >> 28;  // the top four bits of a hash
  const auto load = static_cast<uint32_t>(70 * LoadAt(uint64_t{number} * 1000)) + noise;
  const Second second = {number, noise, load, number % 120 < 8 ? 10U : 1U};
  // Words without a column get values that no column has, so that a wrong offset is seen.
  std::array<uint32_t, kRecordSize / sizeof(uint32_t)> record;
  std::iota(record.begin(), record.end(), kNotShown);
  for (const Column &column : kColumns) {
    if (column.valueOf != nullptr) record[column.offset / 4] = column.valueOf(second);
  }
  const auto setOperations = [&](uint32_t offset, uint32_t count, uint32_t latency) {
    const uint32_t operations[] = {count, count * latency, 9 * latency};
    std::ranges::copy(operations, &record[offset / 4]);
  };
  for (uint32_t priority = 0; priority < kPriorityCount; ++priority) {
    const uint32_t place = priority * kOperationsSize;
    setOperations(kWritesOffset + place, (3 * load) >> priority, (90 + noise) * second.slowness);
    setOperations(kReadsOffset + place, (7 * load) >> priority, 60 + noise + 5 * second.slowness);
  }
  for (const uint32_t word : record) Append(word, buffer);
}

void AppendSnapshot(uint64_t age, std::string *buffer) {
  const auto last = static_cast<uint32_t>(age / 1000);
  for (uint32_t ago = kRecordCount; ago-- > 0;) AppendRecord(last - ago, buffer);
}

// Describes the snapshot. The last record that a header counts is never printed, so the header
// counts one record more than there are.
void AppendSnapshotHeader(std::string *buffer) {
  constexpr uint32_t kVersion = 6;
  constexpr uint32_t kTextOffset = 36;
  constexpr uint32_t kColumnsOffset = kTextOffset + kHeaderText.size();
  for (const uint32_t word :
       {0U, kVersion, kRecordSize, kRecordCount + 1, 0U, 0U, kColumnsOffset, 0U, 0U}) {
    Append(word, buffer);
  }
  buffer->append(kHeaderText);
  Append(uint64_t{std::size(kColumns)}, buffer);  // and the unused bytes after it
  for (const Column &column : kColumns) {
    Append(uint32_t{column.kind}, buffer);  // and the unused bytes after it
    Append(column.offset, buffer);
    Append(column.kind == kPriorities ? kPriorityCount * kOperationsSize : 4, buffer);
    buffer->append(column.format).append(kFormatSize - column.format.size(), '\0');
  }
}

// The controller's age now; at least the length of a snapshot, even when the clock is set to an
// earlier time than the first power-on.
uint64_t AgeNow() {
  using std::chrono::milliseconds;
  const int64_t now =
      std::chrono::duration_cast<milliseconds>(std::chrono::system_clock::now().time_since_epoch())
          .count();
  constexpr auto kPowerOn = static_cast<int64_t>(kFirstPowerOn * 1000);
  constexpr int64_t kLeast = int64_t{kRecordCount} * 1000;
  return static_cast<uint64_t>(std::max(now - kPowerOn, kLeast));
}

}  // namespace

std::string MakeOwnBuffer(std::string_view key) {
  std::string buffer;
  if (key == "statistics") AppendCounters<uint32_t, uint64_t, 8>(kStatistics, AgeNow(), &buffer);
  if (key == "msp") AppendCounters<uint16_t, uint32_t, 1>(kMspStatistics, AgeNow(), &buffer);
  if (key == "snapshot") AppendSnapshot(AgeNow(), &buffer);
  if (key == "snapshot_header") AppendSnapshotHeader(&buffer);
  return buffer;
}

}  // namespace simulated
