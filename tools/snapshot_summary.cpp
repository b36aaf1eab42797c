// What a snapshot says as a whole.

#include "tools/snapshot_summary.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdio>

#include "morwick/little_endian.h"
#include "morwick/snapshot.h"

namespace tools {
namespace {

constexpr size_t kSlowest = 5;
constexpr size_t kPriorities = std::extent_v<decltype(SnapshotRecord::reads)>;

constexpr char kExplanation[] = R"(
Latencies in microseconds. An interval's latency is its mean: total latency by operations, of
all priorities. Percentiles are of these means, by nearest rank; intervals without operations
are left out. The maximum is of a single operation.

)";

std::string Decimal(std::optional<double> number, const char *format) {
  if (!number) return "-";
  std::array<char, 64> text;
  std::snprintf(text.data(), text.size(), format, *number);
  return text.data();
}

std::string OneDecimal(std::optional<double> number) { return Decimal(number, "%.1f"); }

// Right-aligned in that width; a blank stands in front of what is wider, too.
std::string Column(const std::string &text, size_t width) {
  return std::string(width - std::min(width - 1, text.size()), ' ') + text;
}

void Member(Json &json, std::string_view key, std::optional<double> number) {
  json.Key(key);
  number ? json.Fraction(*number) : json.Null();
}

}  // namespace

void SnapshotSummary::Operations::Add(std::string_view record, size_t operations, size_t host,
                                      size_t nand) {
  const uint32_t timestamp = LoadLittleEndian32(&record[offsetof(SnapshotRecord, timestamp)]);
  hostSectors += LoadLittleEndian32(&record[host]);
  nandSectors += LoadLittleEndian32(&record[nand]);
  uint64_t operationsHere = 0;
  uint64_t latencyHere = 0;
  for (size_t k = 0; k < kPriorities; ++k) {
    const std::string_view triple = record.substr(operations + k * sizeof(SnapshotOperations));
    operationsHere += LoadLittleEndian32(&triple[offsetof(SnapshotOperations, count)]);
    latencyHere += LoadLittleEndian32(&triple[offsetof(SnapshotOperations, totalLatency)]);
    const uint32_t most = LoadLittleEndian32(&triple[offsetof(SnapshotOperations, maxLatency)]);
    if (most > 0 && (!maximum || most > maximum->latency)) maximum = {timestamp, double(most)};
  }
  count += operationsHere;
  totalLatency += latencyHere;
  if (operationsHere == 0) return;
  const Interval interval = {
      timestamp, static_cast<double>(latencyHere) / static_cast<double>(operationsHere)};
  means.push_back(interval.latency);
  // Of two that are equally slow the earlier one stays in front.
  slowest.insert(std::ranges::upper_bound(slowest, interval.latency, std::ranges::greater(),
                                          &Interval::latency),
                 interval);
  if (slowest.size() > kSlowest) slowest.pop_back();
}

std::optional<double> SnapshotSummary::Operations::Mean() const {
  if (count == 0) return std::nullopt;
  return static_cast<double>(totalLatency) / static_cast<double>(count);
}

std::optional<double> SnapshotSummary::Operations::Percentile(unsigned percent) {
  if (means.empty()) return std::nullopt;
  const size_t rank = (means.size() * percent + 99) / 100;  // counted from 1, rounded up
  const auto place = means.begin() + static_cast<ptrdiff_t>(rank - 1);
  std::nth_element(means.begin(), place, means.end());
  return *place;
}

std::optional<double> SnapshotSummary::Operations::NandPerHost() const {
  if (hostSectors == 0) return std::nullopt;
  return static_cast<double>(nandSectors) / static_cast<double>(hostSectors);
}

void SnapshotSummary::Add(std::string_view record) {
  ++intervals_;
  reads_.Add(record, offsetof(SnapshotRecord, reads), offsetof(SnapshotRecord, hostReads),
             offsetof(SnapshotRecord, nandReads));
  writes_.Add(record, offsetof(SnapshotRecord, writes), offsetof(SnapshotRecord, hostWrites),
              offsetof(SnapshotRecord, nandWrites));
}

void SnapshotSummary::Print(Output &output) {
  output.Write("Intervals: " + std::to_string(intervals_) + kExplanation);
  output.Write("        operations       mean     median        p95        p99    maximum\n");
  for (Operations *each : {&reads_, &writes_}) {
    std::string line(each->name);
    line.resize(6, ' ');
    line += Column(std::to_string(each->count), 12) + Column(OneDecimal(each->Mean()), 11);
    for (const unsigned percent : {50U, 95U, 99U}) {
      line += Column(OneDecimal(each->Percentile(percent)), 11);
    }
    if (each->maximum) {
      line += Column(Decimal(each->maximum->latency, "%.0f"), 11) +
              " at T=" + std::to_string(each->maximum->timestamp);
    } else {
      line += Column("-", 11);
    }
    output.Write(line + "\n");
  }
  output.Write("\n4k sectors      host          NAND   NAND/host\n");
  for (const Operations *each : {&reads_, &writes_}) {
    std::string line(each->name);
    line.resize(6, ' ');
    output.Write(line + Column(std::to_string(each->hostSectors), 14) +
                 Column(std::to_string(each->nandSectors), 14) +
                 Column(Decimal(each->NandPerHost(), "%.3f"), 12) + "\n");
  }
  output.Write("\nSlowest intervals\n");
  for (const Operations *each : {&reads_, &writes_}) {
    std::string line(each->name);
    line.resize(6, ' ');
    for (const Interval &interval : each->slowest) {
      line += "  T=" + std::to_string(interval.timestamp) + " " + OneDecimal(interval.latency);
    }
    output.Write(line + "\n");
  }
}

void SnapshotSummary::Print(Json &json) {
  json.Key("summary");
  json.BeginObject();
  json.Member("intervals", intervals_);
  for (Operations *each : {&reads_, &writes_}) {
    json.Key(each->name);
    json.BeginObject();
    json.Member("operations", each->count);
    Member(json, "mean_latency_us", each->Mean());
    Member(json, "median_latency_us", each->Percentile(50));
    Member(json, "p95_latency_us", each->Percentile(95));
    Member(json, "p99_latency_us", each->Percentile(99));
    if (each->maximum) {
      Member(json, "maximum_latency_us", each->maximum->latency);
      json.Member("maximum_at", each->maximum->timestamp);
    }
    json.Member("host_sectors", each->hostSectors);
    json.Member("nand_sectors", each->nandSectors);
    Member(json, "nand_per_host", each->NandPerHost());
    json.Key("slowest");
    json.BeginArray();
    for (const Interval &interval : each->slowest) {
      json.BeginObject();
      json.Member("timestamp", interval.timestamp);
      Member(json, "mean_latency_us", interval.latency);
      json.EndObject();
    }
    json.EndArray();
    json.EndObject();
  }
  json.EndObject();
}

}  // namespace tools
