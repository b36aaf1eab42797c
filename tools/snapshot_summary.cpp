// What a snapshot says as a whole.

#include "tools/snapshot_summary.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdio>

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

void PrintBounds(Json &json, std::optional<LatencyBounds::Bounds> bounds) {
  if (!bounds) {
    json.Null();
    return;
  }
  json.BeginObject();
  json.Member("least", bounds->least);
  json.Member("most", bounds->most);
  json.EndObject();
}

}  // namespace

std::string MissingForSummary(const SnapshotColumns &columns) {
  std::string missing;
  for (const std::string_view label :
       {"RO", "RL", "RM", "WO", "WL", "WM", "HR", "HW", "NR", "NW", "T"}) {
    const size_t count = columns.OffsetsOf(label).size();
    // Latencies are there for each number of operations.
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
  counts = offsetsOf(letter, 'O');
  totals = offsetsOf(letter, 'L');
  maxima = offsetsOf(letter, 'M');
  host = offsetsOf('H', letter).front();
  nand = offsetsOf('N', letter).front();
}

void SnapshotSummary::Operations::Add(uint32_t timestamp, std::string_view record) {
  const auto number = [&](uint32_t offset) { return LoadLittleEndian32(&record[offset]); };
  hostSectors += number(host);
  nandSectors += number(nand);
  uint64_t operationsHere = 0;
  uint64_t latencyHere = 0;
  for (size_t k = 0; k < counts.size(); ++k) {
    const SnapshotOperations group = {number(counts[k]), number(totals[k]), number(maxima[k])};
    bounds.Add(group);
    operationsHere += group.count;
    latencyHere += group.totalLatency;
    if (group.maxLatency > 0 && (!maximum || group.maxLatency > maximum->latency)) {
      maximum = {timestamp, double(group.maxLatency)};
    }
  }
  count += operationsHere;
  totalLatency += latencyHere;
  if (operationsHere == 0) return;
  const Interval interval = {
      timestamp, static_cast<double>(latencyHere) / static_cast<double>(operationsHere)};
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

std::optional<double> SnapshotSummary::Operations::NandPerHost() const {
  if (hostSectors == 0) return std::nullopt;
  return static_cast<double>(nandSectors) / static_cast<double>(hostSectors);
}

SnapshotSummary::SnapshotSummary(const SnapshotColumns &columns)
    : timestamp_(columns.OffsetsOf("T").front()),
      reads_("reads", 'R', columns),
      writes_("writes", 'W', columns) {}

void SnapshotSummary::Add(std::string_view record) {
  ++intervals_;
  const uint32_t timestamp = LoadLittleEndian32(&record[timestamp_]);
  reads_.Add(timestamp, record);
  writes_.Add(timestamp, record);
}

void SnapshotSummary::Print(Output &output) const {
  output.Write("Intervals: " + std::to_string(intervals_) + kExplanation);
  output.Write(
      "        operations       mean          median             p95             p99    maximum\n");
  for (const Operations *each : {&reads_, &writes_}) {
    std::string line(each->name);
    line.resize(6, ' ');
    line += Column(std::to_string(each->count), 12) + Column(OneDecimal(each->Mean()), 11);
    for (const auto &[percent, key] : kPercentiles) {
      const auto bounds = each->bounds.Percentile(percent);
      line += Column(
          bounds ? std::to_string(bounds->least) + " to " + std::to_string(bounds->most) : "-", 16);
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

void SnapshotSummary::Print(Json &json) const {
  json.Key("summary");
  json.BeginObject();
  json.Member("intervals", intervals_);
  for (const Operations *each : {&reads_, &writes_}) {
    json.Key(each->name);
    json.BeginObject();
    json.Member("operations", each->count);
    Member(json, "mean_latency_us", each->Mean());
    for (const auto &[percent, key] : kPercentiles) {
      json.Key(key);
      PrintBounds(json, each->bounds.Percentile(percent));
    }
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
