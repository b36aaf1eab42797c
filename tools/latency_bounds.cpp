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
// The search starts at the guess, and is quick where that is near.
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
  // Counted from 1, rounded up; the count times a hundred may not fit.
  const uint64_t rank = count / 100 * percent + (count % 100 * percent + 99) / 100;
  const auto isReached = [&](uint32_t latency) {
    return sum([=](const auto &group) { return MostAtMost(group, latency); }) >= rank;
  };
  const auto isPassed = [&](uint32_t latency) {
    return sum([=](const auto &group) { return MostAtLeast(group, latency + 1); }) <= count - rank;
  };
  return {First(guess.least, maximum_, isReached), First(guess.most, maximum_, isPassed)};
}

std::optional<LatencyBounds::Bounds> LatencyBounds::Percentile(unsigned percent) const {
  if (groups_.empty()) return std::nullopt;
  return Search(groups_, percent, Search(sample_, percent, {}));
}

}  // namespace tools
