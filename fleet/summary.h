// The main figures of a KVR dump.
#ifndef FLEET_SUMMARY_H
#define FLEET_SUMMARY_H

#include <cstdint>
#include <functional>
#include <optional>
#include <string_view>
#include <vector>

#include "morwick/kvr_stats.h"

namespace fleet {

// A figure with its name: one value or those of an array, or a ratio.
struct Figure {
  std::string_view name;
  std::vector<uint64_t> values;
  std::optional<double> ratio;  // instead of values
};

// The summary fields that the dump has, in the order of KVRStatsCxt, then writeAmplification: the
// sectors written to NAND for each sector that the host wrote.
std::vector<Figure> Summarise(const KVRStatsCxt &summary,
                              const std::function<bool(std::string_view name)> &isPresent);

}  // namespace fleet

#endif
