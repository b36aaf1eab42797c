// What is certain of single operations' latencies.

#include "tools/latency_bounds.h"

#include <algorithm>

namespace tools {
namespace {

// How many operations of a group can take at least so long, the others nothing: one takes the
// maximum, and what is left of the total is enough for so many more.
uint64_t MostAtLeast(const SnapshotOperations &group, uint32_t latency) {
  if (latency == 0) return group.count;
  if (latency > group.maxLatency) return 0;
  if (group.totalLatency <= group.maxLatency) return 1;
  const uint32_t others = (group.totalLatency - group.maxLatency) / latency;
  return 1 + std::min(others, group.count - 1);
}

// How many can take at most so long, the others the maximum, which one takes in any case: each
// saves the difference, and together they can save what the total lacks.
uint64_t MostAtMost(const SnapshotOperations &group, uint32_t latency) {
  if (latency >= group.maxLatency) return group.count;
  const uint64_t allAtMaximum = uint64_t{group.count} * group.maxLatency;
  if (group.totalLatency >= allAtMaximum) return 0;
  return std::min<uint64_t>((allAtMaximum - group.totalLatency) / (group.maxLatency - latency),
                            group.count - 1);
}

// The first latency for which it holds, as it then does for all above; `last` if for none below.
template <typename Holds>
uint32_t First(uint32_t last, Holds holds) {
  uint32_t first = 0;
  while (first < last) {
    const uint32_t middle = first + (last - first) / 2;
    if (holds(middle)) {
      last = middle;
    } else {
      first = middle + 1;
    }
  }
  return first;
}

}  // namespace

void LatencyBounds::Add(const SnapshotOperations &group) {
  if (group.count == 0) return;
  groups_.push_back(group);
  count_ += group.count;
  maximum_ = std::max(maximum_, group.maxLatency);
}

std::optional<LatencyBounds::Bounds> LatencyBounds::Percentile(unsigned percent) const {
  if (count_ == 0) return std::nullopt;
  // Counted from 1, rounded up; the count times a hundred may not fit.
  const uint64_t rank = count_ / 100 * percent + (count_ % 100 * percent + 99) / 100;
  const auto sum = [&](auto most, uint32_t latency) {
    uint64_t total = 0;
    for (const SnapshotOperations &group : groups_) total += most(group, latency);
    return total;
  };
  return Bounds{First(maximum_, [&](uint32_t latency) { return sum(MostAtMost, latency) >= rank; }),
                First(maximum_, [&](uint32_t latency) {
                  return sum(MostAtLeast, latency + 1) <= count_ - rank;
                })};
}

}  // namespace tools
