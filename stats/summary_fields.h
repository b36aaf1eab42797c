// The summary fields of a KVR context. One table serves the parser and morwick/summary.h.
#ifndef STATS_SUMMARY_FIELDS_H
#define STATS_SUMMARY_FIELDS_H

#include "morwick/kvr_stats.h"

namespace morwick {

// Stores the values of a key, as many as are configured, if the key has a summary field.
void SetSummaryField(KVRStatsCxt *ctx, uint32_t id, const uint8_t *values);

}  // namespace morwick

#endif
