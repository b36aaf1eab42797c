// What a snapshot says as a whole: operations and latencies, sectors, the slowest intervals.
#ifndef TOOLS_SNAPSHOT_SUMMARY_H
#define TOOLS_SNAPSHOT_SUMMARY_H

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

#include "tools/json.h"
#include "tools/output.h"

namespace tools {

class SnapshotSummary {
 public:
  // Takes one record of the fixed layout.
  void Add(std::string_view record);

  // Once, when all records were taken.
  void Print(Output &output);
  void Print(Json &json);

 private:
  // An interval, by its timestamp, and a latency in microseconds.
  struct Interval {
    uint32_t timestamp;
    double latency;
  };

  // The reads, or the writes, of all priorities.
  struct Operations {
    std::string_view name;
    uint64_t count = 0;
    uint64_t totalLatency = 0;
    std::optional<Interval> maximum = {};
    std::vector<double> means = {};      // of each interval with operations
    std::vector<Interval> slowest = {};  // by mean, the slowest first
    uint64_t hostSectors = 0;
    uint64_t nandSectors = 0;

    void Add(std::string_view record, size_t operations, size_t host, size_t nand);
    std::optional<double> Mean() const;
    std::optional<double> Percentile(unsigned percent);  // nearest rank
    std::optional<double> NandPerHost() const;
  };

  Operations reads_{.name = "reads"};
  Operations writes_{.name = "writes"};
  uint64_t intervals_ = 0;
};

}  // namespace tools

#endif
