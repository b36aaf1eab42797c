// The columns of the fixed snapshot layout, in the order of the text: their names for CSV and JSON,
// and where their numbers lie in a record. A session holds them against the text.
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
    {"RO_0", FIELD(reads[0].count)},
    {"RO_1", FIELD(reads[1].count)},
    {"RO_2", FIELD(reads[2].count)},
    {"RO_3", FIELD(reads[3].count)},
    {"RL_0", FIELD(reads[0].totalLatency)},
    {"RL_1", FIELD(reads[1].totalLatency)},
    {"RL_2", FIELD(reads[2].totalLatency)},
    {"RL_3", FIELD(reads[3].totalLatency)},
    {"RM_0", FIELD(reads[0].maxLatency)},
    {"RM_1", FIELD(reads[1].maxLatency)},
    {"RM_2", FIELD(reads[2].maxLatency)},
    {"RM_3", FIELD(reads[3].maxLatency)},
    {"WO_0", FIELD(writes[0].count)},
    {"WO_1", FIELD(writes[1].count)},
    {"WO_2", FIELD(writes[2].count)},
    {"WO_3", FIELD(writes[3].count)},
    {"WL_0", FIELD(writes[0].totalLatency)},
    {"WL_1", FIELD(writes[1].totalLatency)},
    {"WL_2", FIELD(writes[2].totalLatency)},
    {"WL_3", FIELD(writes[3].totalLatency)},
    {"WM_0", FIELD(writes[0].maxLatency)},
    {"WM_1", FIELD(writes[1].maxLatency)},
    {"WM_2", FIELD(writes[2].maxLatency)},
    {"WM_3", FIELD(writes[3].maxLatency)},
};

#undef FIELD

}  // namespace tools

#endif
