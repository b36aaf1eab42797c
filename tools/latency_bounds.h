// What is certain of single operations' latencies where only sums of groups of them are known.
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

  // The least and the most that the percentile can be, by nearest rank: there are operations that
  // make the same groups and have it. Nothing without operations. Of groups that cannot be, such as
  // one whose maximum is above its total, it is some latency up to the largest maximum.
  struct Bounds {
    uint32_t least = 0, most = 0;
  };
  std::optional<Bounds> Percentile(unsigned percent) const;

 private:
  using Groups = std::deque<SnapshotOperations>;  // whose growth takes no room three times

  Bounds Search(const Groups &groups, unsigned percent, Bounds guess) const;

  Groups groups_;
  Groups sample_;  // a few of them, of any priority: the percentiles of all are near theirs
  uint32_t maximum_ = 0;
};

}  // namespace tools

#endif
