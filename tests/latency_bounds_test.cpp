// Bounds of percentiles, against operations that are known one by one.

#include "tools/latency_bounds.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <numeric>
#include <random>
#include <vector>

namespace {

using Latencies = std::vector<uint32_t>;

SnapshotOperations SumUp(const Latencies &latencies) {
  return {static_cast<uint32_t>(latencies.size()),
          std::accumulate(latencies.begin(), latencies.end(), 0U), std::ranges::max(latencies)};
}

// By nearest rank.
uint32_t Percentile(Latencies latencies, unsigned percent) {
  std::ranges::sort(latencies);
  return latencies[(latencies.size() * percent + 99) / 100 - 1];
}

TEST(LatencyBoundsTest, HoldForAnyOperations) {
  std::mt19937 random(1);
  for (int trial = 0; trial < 10000; ++trial) {
    tools::LatencyBounds bounds;
    Latencies all;
    for (auto groups = random() % 5 + 1; groups > 0; --groups) {
      Latencies group(random() % 20 + 1);
      const auto bits = random() % 28;
      for (uint32_t &latency : group)
        latency = static_cast<uint32_t>(random() >> bits >> random() % 5 >> 5);
      bounds.Add(SumUp(group));
      bounds.Add({0, 7, 0xffffffff});  // no operation, whatever else is said of it
      all.insert(all.end(), group.begin(), group.end());
    }
    for (const unsigned percent : {1U, 50U, 95U, 99U}) {
      const auto [least, most] = *bounds.Percentile(percent);
      ASSERT_LE(least, Percentile(all, percent)) << trial;
      ASSERT_GE(most, Percentile(all, percent)) << trial;
    }
  }
}

// All operations of up to three a group, in two groups: what comes to the same groups is what the
// bounds must span, and no more.
TEST(LatencyBoundsTest, AreAsNarrowAsCanBe) {
  std::vector<Latencies> groups;
  for (size_t count = 1; count <= 3; ++count) {
    for (uint32_t i = 0; i < 5 * 5 * 5; ++i) {
      const uint32_t latencies[] = {i % 5, i / 5 % 5, i / 25};
      if (count == 3 || latencies[count] == 0) groups.emplace_back(latencies, latencies + count);
    }
  }
  using Group = std::tuple<uint32_t, uint32_t, uint32_t>;
  std::map<std::tuple<Group, Group, unsigned>, std::pair<uint32_t, uint32_t>> spans;
  const auto key = [](const Latencies &group) {
    const auto [count, total, maximum] = SumUp(group);
    return Group(count, total, maximum);
  };
  for (const Latencies &one : groups) {
    for (const Latencies &other : groups) {
      Latencies all = one;
      all.insert(all.end(), other.begin(), other.end());
      for (const unsigned percent : {20U, 50U, 95U}) {
        const uint32_t seen = Percentile(all, percent);
        auto &[least, most] =
            spans.try_emplace({key(one), key(other), percent}, seen, seen).first->second;
        least = std::min(least, seen);
        most = std::max(most, seen);
      }
    }
  }
  for (const auto &[groupsAndPercent, span] : spans) {
    const auto &[one, other, percent] = groupsAndPercent;
    tools::LatencyBounds bounds;
    for (const auto &[count, total, maximum] : {one, other}) bounds.Add({count, total, maximum});
    const auto [least, most] = *bounds.Percentile(percent);
    ASSERT_EQ(std::pair(least, most), span) << testing::PrintToString(groupsAndPercent);
  }
  EXPECT_GT(spans.size(), 1000U);
}

TEST(LatencyBoundsTest, TakesGroupsThatCannotBe) {
  constexpr uint32_t kMost = 0xffffffff;
  EXPECT_FALSE(tools::LatencyBounds().Percentile(50));
  for (const SnapshotOperations &group : {SnapshotOperations{kMost, kMost, kMost},
                                          {3, 4, 5},
                                          {3, 16, 5},
                                          {1, 0, kMost},
                                          {kMost, 0, kMost},
                                          {2, kMost, 1},
                                          {2, 3, 0}}) {
    tools::LatencyBounds bounds;
    bounds.Add(group);
    const auto [least, most] = *bounds.Percentile(99);
    EXPECT_TRUE(least <= most && most <= group.maxLatency)
        << group.count << ' ' << least << ' ' << most;
  }
}

}  // namespace
