// The summary fields of a KVR context: the one table that fills and lists them.
#ifndef STATS_SUMMARY_FIELDS_H
#define STATS_SUMMARY_FIELDS_H

#include "morwick/kvr_stats.h"

namespace morwick {

// Keeps the values of a key that has a summary field; its configured number of them must be there.
void SetSummaryField(KVRStatsCxt *ctx, uint32_t id, const uint8_t *values);

}  // namespace morwick

#endif
