// Bounds of percentiles, against operations that are known one by one.

#include "tools/latency_bounds.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <vector>

namespace {

TEST(LatencyBoundsTest, HoldForAnyOperations) {
  std::mt19937 random(1);
  for (int trial = 0; trial < 10000; ++trial) {
    tools::LatencyBounds bounds;
    std::vector<uint32_t> all;
    for (auto groups = random() % 5 + 1; groups > 0; --groups) {
      SnapshotOperations group = {};
      const auto bits = random() % 28;
      for (auto count = random() % 20 + 1; count > 0; --count) {
        all.push_back(static_cast<uint32_t>(random() >> bits >> random() % 5 >> 5));
        ++group.count;
        group.totalLatency += all.back();
        group.maxLatency = std::max(group.maxLatency, all.back());
      }
      bounds.Add(group);
      bounds.Add({0, 7, 0xffffffff});  // no operation, whatever else is said of it
    }
    std::ranges::sort(all);
    for (const unsigned percent : {1U, 50U, 95U, 99U}) {
      const uint32_t value = all[(all.size() * percent + 99) / 100 - 1];  // by nearest rank
      const auto [least, most] = *bounds.Percentile(percent);
      ASSERT_TRUE(least <= value && value <= most) << trial << ' ' << percent;
    }
  }
}

}  // namespace
