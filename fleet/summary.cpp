#include "fleet/summary.h"

#include "morwick/summary.h"

namespace fleet {

std::vector<Figure> Summarise(const KVRStatsCxt &summary,
                              const std::function<bool(std::string_view name)> &isPresent) {
  std::vector<Figure> figures;
  for (uint32_t i = 0; i < MorwickSummaryFieldCount(); ++i) {
    const MorwickSummaryField &field = *MorwickSummaryFieldAt(i);
    if (!isPresent(field.name)) continue;
    Figure &figure = figures.emplace_back(Figure{field.name, {}, std::nullopt});
    for (uint32_t index = 0; index < field.valueCount; ++index) {
      figure.values.push_back(MorwickSummaryValue(&summary, &field, index));
    }
  }
  if (isPresent("hostWrites") && isPresent("nandWrites") && summary.hostWrites > 0) {
    const auto host = static_cast<double>(summary.hostWrites);
    figures.push_back({"writeAmplification", {}, static_cast<double>(summary.nandWrites) / host});
  }
  return figures;
}

}  // namespace fleet
