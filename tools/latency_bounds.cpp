// Bounds of the percentiles of latencies.

#include "tools/latency_bounds.h"

#include <algorithm>

namespace tools {
namespace {

// How many operations of the group can take at least `latency`. The number is largest when one
// takes the maximum, as many others as the rest of the total allows take little more than
// `latency`, and the remaining ones take 0.
uint64_t MostAtLeast(const SnapshotOperations &group, uint32_t latency) {
  if (latency == 0) return group.count;
  if (latency > group.maxLatency) return 0;
  if (group.totalLatency <= group.maxLatency) return 1;
  const uint32_t others = (group.totalLatency - group.maxLatency) / latency;
  return 1 + std::min(others, group.count - 1);
}

// How many operations of the group can take at most `latency`. If all took the maximum, the total
// would be larger by `missing`. Each operation of at most `latency` takes up at least maxLatency -
// latency of that. One operation takes the maximum.
uint64_t MostAtMost(const SnapshotOperations &group, uint32_t latency) {
  if (latency >= group.maxLatency) return group.count;
  const uint64_t allAtMaximum = uint64_t{group.count} * group.maxLatency;
  if (group.totalLatency >= allAtMaximum) return 0;
  const uint64_t missing = allAtMaximum - group.totalLatency;
  return std::min<uint64_t>(missing / (group.maxLatency - latency), group.count - 1);
}

// Returns the lowest latency below `last` for which `holds` is true, or `last` when there is none.
// Once `holds` is true, it is true for all higher latencies. The guess, at most `last`, is usually
// close: the binary search stays at most `step` away from it, four times as far each time.
template <typename Holds>
uint32_t First(uint32_t guess, uint32_t last, Holds holds) {
  uint32_t first = 0;
  for (int64_t step = 1; first < last; step = std::min<int64_t>(step * 4, UINT32_MAX)) {
    const int64_t middle = first + (last - first) / 2;
    const auto tried = static_cast<uint32_t>(std::clamp(middle, guess - step, guess + step));
    if (holds(tried)) {
      last = tried;
    } else {
      first = tried + 1;
    }
  }
  return first;
}

}  // namespace

void LatencyBounds::Add(const SnapshotOperations &group) {
  if (group.count == 0) return;
  // Callers add the priorities in turn. A prime distance does not always meet the same priority.
  if (groups_.size() % 61 == 0) sample_.push_back(group);
  groups_.push_back(group);
  maximum_ = std::max(maximum_, group.maxLatency);
}

LatencyBounds::Bounds LatencyBounds::Search(const Groups &groups, unsigned percent,
                                            Bounds guess) const {
  const auto sum = [&](auto number) {
    uint64_t total = 0;
    for (const SnapshotOperations &group : groups) total += number(group);
    return total;
  };
  const uint64_t count = sum([](const SnapshotOperations &group) { return group.count; });
  // Counted from 1, rounded up. Divided first, because count * percent may not fit.
  const uint64_t rank = count / 100 * percent + (count % 100 * percent + 99) / 100;
  // The percentile can be as low as `latency`: enough operations can take no more.
  const auto canBeAtMost = [&](uint32_t latency) {
    return sum([=](const auto &group) { return MostAtMost(group, latency); }) >= rank;
  };
  // It cannot be higher: too few operations can take more than `latency`.
  const auto mustBeAtMost = [&](uint32_t latency) {
    return sum([=](const auto &group) { return MostAtLeast(group, latency + 1); }) <= count - rank;
  };
  return {First(guess.least, maximum_, canBeAtMost), First(guess.most, maximum_, mustBeAtMost)};
}

std::optional<LatencyBounds::Bounds> LatencyBounds::Percentile(unsigned percent) const {
  if (groups_.empty()) return std::nullopt;
  return Search(groups_, percent, Search(sample_, percent, {}));
}

}  // namespace tools
