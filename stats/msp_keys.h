// The keys of the MSP statistics record stream.
#ifndef STATS_MSP_KEYS_H
#define STATS_MSP_KEYS_H

#include "stats/key_table.h"

namespace morwick {

using MSPKeyTable = KeyTable<4096, 4119, 95>;
extern const MSPKeyTable kMSPKeys;

}  // namespace morwick

#endif
