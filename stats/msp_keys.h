// The keys of the MSP statistics record stream.
#ifndef STATS_MSP_KEYS_H
#define STATS_MSP_KEYS_H

#include "stats/key_table.h"

namespace morwick {

// The row of the key id, or null for an unknown id.
const KeyRow *FindMSPKey(uint32_t id);

}  // namespace morwick

#endif
