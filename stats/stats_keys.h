// The keys of the 64-bit statistics record stream.
#ifndef STATS_STATS_KEYS_H
#define STATS_STATS_KEYS_H

#include "stats/key_table.h"

namespace morwick {

using StatsKeyTable = KeyTable<1, 659, 568>;
extern const StatsKeyTable kStatsKeys;

}  // namespace morwick

#endif
