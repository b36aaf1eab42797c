// The columns of the fixed snapshot layout, in the order of the text: their names for CSV and JSON,
// and where their numbers lie in a record.
#ifndef TOOLS_SNAPSHOT_COLUMNS_H
#define TOOLS_SNAPSHOT_COLUMNS_H

#include <cstddef>
#include <string_view>

#include "morwick/snapshot.h"

namespace tools {

struct SnapshotColumn {
  std::string_view name;
  size_t offset;
};

#define FIELD(name) offsetof(SnapshotRecord, name)
#define PRIORITIES(letter, operations)                                                        \
  {letter "O_0", FIELD(operations[0].count)}, {letter "O_1", FIELD(operations[1].count)},     \
      {letter "O_2", FIELD(operations[2].count)}, {letter "O_3", FIELD(operations[3].count)}, \
      {letter "L_0", FIELD(operations[0].totalLatency)},                                      \
      {letter "L_1", FIELD(operations[1].totalLatency)},                                      \
      {letter "L_2", FIELD(operations[2].totalLatency)},                                      \
      {letter "L_3", FIELD(operations[3].totalLatency)},                                      \
      {letter "M_0", FIELD(operations[0].maxLatency)},                                        \
      {letter "M_1", FIELD(operations[1].maxLatency)},                                        \
      {letter "M_2", FIELD(operations[2].maxLatency)}, {                                      \
    letter "M_3", FIELD(operations[3].maxLatency)                                             \
  }

constexpr SnapshotColumn kSnapshotColumns[] = {
    {"T", FIELD(timestamp)},
    {"E", FIELD(erasedBands)},
    {"HR", FIELD(hostReads)},
    {"HW", FIELD(hostWrites)},
    {"NR", FIELD(nandReads)},
    {"NW", FIELD(nandWrites)},
    {"TH_us", FIELD(hysteresisTime)},  // as in the record; the text has milliseconds
    {"GC", FIELD(collectedSectors)},
    {"W", FIELD(wearLevelBands)},
    {"BI", FIELD(intermediatePendingErase)},
    {"BU", FIELD(userPendingErase)},
    {"V", FIELD(freeNodes)},
    {"BF_fragments", FIELD(bufferFragments)},
    {"BF_high_water", FIELD(bufferHighWater)},
    {"P", FIELD(preemptPercent)},
    {"H_normal", FIELD(qosDelaysNormal)},
    {"H_extreme", FIELD(qosDelaysExtreme)},
    {"X_succeeded", FIELD(expeditesSucceeded)},
    {"X_failed", FIELD(expeditesFailed)},
    {"L_age", FIELD(oldestCommandAge)},
    {"L_interval", FIELD(qosInterval)},
    {"C_min", FIELD(commandTagsMin)},
    {"C_max", FIELD(commandTagsMax)},
    {"S", FIELD(freeSegments)},
    {"U", FIELD(hostUnmaps)},
    PRIORITIES("R", reads),
    PRIORITIES("W", writes),
};

#undef PRIORITIES
#undef FIELD

}  // namespace tools

#endif
