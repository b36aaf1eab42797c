// The summary fields of a KVR context: the one table that fills and lists them.
#ifndef STATS_SUMMARY_FIELDS_H
#define STATS_SUMMARY_FIELDS_H

#include "morwick/kvr_stats.h"

namespace morwick {

// Stores the values of a key that has a summary field. The record must have the configured number.
void SetSummaryField(KVRStatsCxt *ctx, uint32_t id, const uint8_t *values);

}  // namespace morwick

#endif
