// The keys of the 64-bit statistics record stream.
#ifndef STATS_STATS_KEYS_H
#define STATS_STATS_KEYS_H

#include "stats/key_table.h"

namespace morwick {

// The row of the key id, or null for an unknown id.
const KeyRow *FindStatsKey(uint32_t id);

}  // namespace morwick

#endif
