// Bounds of the percentiles of latencies, where only count, sum and maximum of groups are known.
#ifndef TOOLS_LATENCY_BOUNDS_H
#define TOOLS_LATENCY_BOUNDS_H

#include <cstdint>
#include <deque>
#include <optional>

#include "morwick/snapshot.h"

namespace tools {

// The percentiles of all operations of all groups.
class LatencyBounds {
 public:
  void Add(const SnapshotOperations &group);

  // The least and the most that the percentile, by nearest rank, can be. Both are exact: some
  // operations with these counts, totals and maxima have it. Nothing without operations. When a
  // group contradicts itself, as with a maximum above its total, both are at most the largest
  // maximum.
  struct Bounds {
    uint32_t least = 0, most = 0;
  };
  std::optional<Bounds> Percentile(unsigned percent) const;

 private:
  using Groups = std::deque<SnapshotOperations>;  // a vector needs three times the room to grow

  Bounds Search(const Groups &groups, unsigned percent, Bounds guess) const;

  Groups groups_;
  Groups sample_;  // a few of the groups; the search among all of them starts at its bounds
  uint32_t maximum_ = 0;
};

}  // namespace tools

#endif
