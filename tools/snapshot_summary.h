// The summary of a snapshot: operations and latencies, sectors, the slowest intervals.
#ifndef TOOLS_SNAPSHOT_SUMMARY_H
#define TOOLS_SNAPSHOT_SUMMARY_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "tools/json.h"
#include "tools/latency_bounds.h"
#include "tools/output.h"
#include "tools/snapshot_columns.h"

namespace tools {

// The labels that the summary needs and the columns lack, such as "RM, HR"; empty for none.
std::string MissingForSummary(const SnapshotColumns &columns);

class SnapshotSummary {
 public:
  // MissingForSummary must be empty for these columns.
  explicit SnapshotSummary(const SnapshotColumns &columns);

  void Add(std::string_view record);

  // Call it when all records are added.
  void Print(Output &output) const;
  void Print(Json &json) const;

 private:
  // An interval, by its timestamp, and a latency in microseconds.
  struct Interval {
    uint32_t timestamp;
    double latency;
  };

  // The reads, or the writes, of all priorities.
  struct Operations {
    // `letter` is the R or W of their labels.
    Operations(std::string_view name, char letter, const SnapshotColumns &columns);

    void Add(uint32_t timestamp, std::string_view record);
    std::optional<double> Mean() const;
    std::optional<double> NandPerHost() const;
    void Print(Json &json) const;

    std::string_view name;
    // In a record; those of operations by priority.
    std::vector<uint32_t> countOffsets, totalOffsets, maximumOffsets;
    uint32_t hostOffset, nandOffset;

    uint64_t count = 0;
    uint64_t totalLatency = 0;
    std::optional<Interval> maximum = {};
    LatencyBounds bounds = {};
    std::vector<Interval> slowest = {};  // by mean, the slowest first
    uint64_t hostSectors = 0;
    uint64_t nandSectors = 0;
  };

  uint32_t timestampOffset_;
  Operations reads_;
  Operations writes_;
  uint64_t intervals_ = 0;
};

}  // namespace tools

#endif
