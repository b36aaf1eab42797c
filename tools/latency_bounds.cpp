// Bounds of the percentiles of latencies.

#include "tools/latency_bounds.h"

#include <algorithm>

namespace tools {
namespace {

// How many operations of a group can take at least `latency`, if the others take 0: one takes the
// maximum, and the rest of the total is shared by as many as it is enough for.
uint64_t MostAtLeast(const SnapshotOperations &group, uint32_t latency) {
  if (latency == 0) return group.count;
  if (latency > group.maxLatency) return 0;
  if (group.totalLatency <= group.maxLatency) return 1;
  const uint32_t others = (group.totalLatency - group.maxLatency) / latency;
  return 1 + std::min(others, group.count - 1);
}

// How many can take at most `latency`, if the others take the maximum, as one always does. Each
// saves at least maxLatency - latency, and all together save allAtMaximum - totalLatency.
uint64_t MostAtMost(const SnapshotOperations &group, uint32_t latency) {
  if (latency >= group.maxLatency) return group.count;
  const uint64_t allAtMaximum = uint64_t{group.count} * group.maxLatency;
  if (group.totalLatency >= allAtMaximum) return 0;
  return std::min<uint64_t>((allAtMaximum - group.totalLatency) / (group.maxLatency - latency),
                            group.count - 1);
}

// The first latency for which `holds` is true, as it then is for all above; `last` if it is true
// for none below. The search starts at the guess, and is quick when the result is near.
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
  if (groups_.size() % 61 == 0) sample_.push_back(group);  // a prime meets every priority
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
  const auto canBeAtMost = [&](uint32_t latency) {
    return sum([=](const auto &group) { return MostAtMost(group, latency); }) >= rank;
  };
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
