// The keys of the MSP statistics record stream.
#ifndef STATS_MSP_KEYS_H
#define STATS_MSP_KEYS_H

#include "stats/key_table.h"

namespace morwick {

// The row of the key, or null for an unknown key.
const KeyRow *FindMSPKey(uint32_t id);

}  // namespace morwick

#endif
