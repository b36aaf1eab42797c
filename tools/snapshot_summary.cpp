// The summary of a snapshot.

#include "tools/snapshot_summary.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstddef>

#include "morwick/little_endian.h"

namespace tools {
namespace {

constexpr size_t kSlowest = 5;
constexpr std::pair<unsigned, const char *> kPercentiles[] = {
    {50, "median_latency_us"}, {95, "p95_latency_us"}, {99, "p99_latency_us"}};

constexpr char kExplanation[] = R"(
Latencies in microseconds, of the operations of all priorities. The median and the percentiles,
by nearest rank, lie between the two bounds that are given. An interval's latency is its mean.

)";

std::string Decimal(std::optional<double> number, int decimals) {
  return number ? fmt::format("{:.{}f}", *number, decimals) : "-";
}

std::optional<double> Ratio(uint64_t number, uint64_t divisor) {
  if (divisor == 0) return std::nullopt;
  return static_cast<double>(number) / static_cast<double>(divisor);
}

}  // namespace

std::string MissingForSummary(const SnapshotColumns &columns) {
  std::string missing;
  for (const std::string_view label :
       {"RO", "RL", "RM", "WO", "WL", "WM", "HR", "HW", "NR", "NW", "T"}) {
    const size_t count = columns.OffsetsOf(label).size();
    // Each number of operations needs its latencies.
    const bool isLatency = label.ends_with('L') || label.ends_with('M');
    const std::string operations = {label[0], 'O'};
    if (count > 0 && (!isLatency || count == columns.OffsetsOf(operations).size())) continue;
    missing.append(missing.empty() ? "" : ", ").append(label);
  }
  return missing;
}

SnapshotSummary::Operations::Operations(std::string_view itsName, char letter,
                                        const SnapshotColumns &columns)
    : name(itsName) {
  const auto offsetsOf = [&](char first, char second) {
    return columns.OffsetsOf(std::string{first, second});
  };
  countOffsets = offsetsOf(letter, 'O');
  totalOffsets = offsetsOf(letter, 'L');
  maximumOffsets = offsetsOf(letter, 'M');
  hostOffset = offsetsOf('H', letter).front();
  nandOffset = offsetsOf('N', letter).front();
}

void SnapshotSummary::Operations::Add(uint32_t timestamp, std::string_view record) {
  const auto number = [&](uint32_t offset) { return LoadLittleEndian32(&record[offset]); };
  hostSectors += number(hostOffset);
  nandSectors += number(nandOffset);
  uint64_t intervalCount = 0;
  uint64_t intervalLatency = 0;
  for (size_t i = 0; i < countOffsets.size(); ++i) {
    const SnapshotOperations group = {number(countOffsets[i]), number(totalOffsets[i]),
                                      number(maximumOffsets[i])};
    bounds.Add(group);
    intervalCount += group.count;
    intervalLatency += group.totalLatency;
    if (group.maxLatency > 0 && (!maximum || group.maxLatency > maximum->latency)) {
      maximum = {timestamp, double(group.maxLatency)};
    }
  }
  count += intervalCount;
  totalLatency += intervalLatency;
  if (intervalCount == 0) return;
  const Interval interval = {timestamp, *Ratio(intervalLatency, intervalCount)};
  // Of two that are equally slow the earlier one stays in front.
  slowest.insert(std::ranges::upper_bound(slowest, interval.latency, std::ranges::greater(),
                                          &Interval::latency),
                 interval);
  if (slowest.size() > kSlowest) slowest.pop_back();
}

std::optional<double> SnapshotSummary::Operations::Mean() const {
  return Ratio(totalLatency, count);
}

std::optional<double> SnapshotSummary::Operations::NandPerHost() const {
  return Ratio(nandSectors, hostSectors);
}

SnapshotSummary::SnapshotSummary(const SnapshotColumns &columns)
    : timestampOffset_(columns.OffsetsOf("T").front()),
      reads_("reads", 'R', columns),
      writes_("writes", 'W', columns) {}

void SnapshotSummary::Add(std::string_view record) {
  ++intervals_;
  const uint32_t timestamp = LoadLittleEndian32(&record[timestampOffset_]);
  reads_.Add(timestamp, record);
  writes_.Add(timestamp, record);
}

void SnapshotSummary::Print(Output &output) const {
  output.Write(fmt::format("Intervals: {}{}", intervals_, kExplanation));
  output.Write(
      "        operations       mean          median             p95             p99    maximum\n");
  for (const Operations *each : {&reads_, &writes_}) {
    std::string line =
        fmt::format("{:<6} {:>11} {:>10}", each->name, each->count, Decimal(each->Mean(), 1));
    for (const auto &[percent, key] : kPercentiles) {
      const auto bounds = each->bounds.Percentile(percent);
      line += fmt::format(" {:>15}",
                          bounds ? fmt::format("{} to {}", bounds->least, bounds->most) : "-");
    }
    line += each->maximum ? fmt::format(" {:>10.0f} at T={}", each->maximum->latency,
                                        each->maximum->timestamp)
                          : fmt::format(" {:>10}", "-");
    output.Write(line + "\n");
  }
  output.Write("\n4k sectors      host          NAND   NAND/host\n");
  for (const Operations *each : {&reads_, &writes_}) {
    output.Write(fmt::format("{:<6} {:>13} {:>13} {:>11}\n", each->name, each->hostSectors,
                             each->nandSectors, Decimal(each->NandPerHost(), 3)));
  }
  output.Write("\nSlowest intervals\n");
  for (const Operations *each : {&reads_, &writes_}) {
    std::string line = fmt::format("{:<6}", each->name);
    for (const Interval &interval : each->slowest) {
      line += fmt::format("  T={} {:.1f}", interval.timestamp, interval.latency);
    }
    output.Write(line + "\n");
  }
}

void SnapshotSummary::Print(Json &json) const {
  json.Object("summary", [&] {
    json.Member("intervals", intervals_);
    reads_.Print(json);
    writes_.Print(json);
  });
}

void SnapshotSummary::Operations::Print(Json &json) const {
  json.Object(name, [&] {
    json.Member("operations", count);
    json.Member("mean_latency_us", Mean());
    for (const auto &[percent, key] : kPercentiles) {
      const auto percentile = bounds.Percentile(percent);
      if (!percentile) {
        json.Member(key, std::nullopt);
        continue;
      }
      json.Object(key, [&] {
        json.Member("least", percentile->least);
        json.Member("most", percentile->most);
      });
    }
    if (maximum) {
      json.Member("maximum_latency_us", maximum->latency);
      json.Member("maximum_at", maximum->timestamp);
    }
    json.Member("host_sectors", hostSectors);
    json.Member("nand_sectors", nandSectors);
    json.Member("nand_per_host", NandPerHost());
    json.Objects("slowest", slowest, [&](const Interval &interval) {
      json.Member("timestamp", interval.timestamp);
      json.Member("mean_latency_us", interval.latency);
    });
  });
}

}  // namespace tools
