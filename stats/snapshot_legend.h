// The legend at the head of a snapshot's text: the meaning of its columns.
#ifndef STATS_SNAPSHOT_LEGEND_H
#define STATS_SNAPSHOT_LEGEND_H

#include <string_view>

#include "stats/checksum.h"

namespace morwick {

// Published letter for letter, with its misspelling and the missing line end after C: readers
// search for it.
// clang-format off: one line of the text a line
inline constexpr std::string_view kSnapshotLegend =
    "Key: \n"
    "T   - Timestamp\n"
    "E   - Erased bands during this time interval\n"
    "HR  - Host Reads (in 4k sectors)\n"
    "HW  - Host Writes (in 4k sectors)\n"
    "NR  - Nand Reads (in 4k sectors)\n"
    "NW  - Nand Writes (in 4k sectors)\n"
    "TH  - Time in Hysteresis in this time interval (in ms)\n"
    "GC  - Number of sectors (4k bytes) completed GC in this time interval\n"
    "W   - Number of wear level bands completed in this time interval\n"
    "BI  - Bands Intermediate (SLC) PendingErase\n"
    "BU  - Bands User (MLC) PendingErase\n"
    "V   - Number of Free Nodes\n"
    "BF  - Buffer Fragments/BufferHighWater\n"
    "P   - Percent of time in DoPreempt rather than DoNormal\n"
    "H   - Qos Delays: Normal/Extreme\n"
    "X   - Successful expedite commands/Failed expedite commands\n"
    "L   - Age of the oldest command in ms (calculated every second)/Qos Interval (in 100us "
    "units)\n"
    "C   - Command tags in use by host (Min/Max)S   - Number of free segs\n"
    "U   - Sectors of host unmaps\n"
    "RO  - Num read ops for this time interval: priority0/priority1/...\n"
    "RL  - Total Read Latency (in us) for this time interval: priority0/priority1/...\n"
    "RM  - Max Read Latency (int us) for this time interval: priority0/priority1/...\n"
    "WO  - Num write ops for this time interval: priority0/priority1/...\n"
    "WL  - Total write latency (in us) for this time interval: priority0/priority1/...\n"
    "WM  - Max write latency (in us) for this time interval: priority0/priority1/...\n"
    "\n";
// clang-format on

static_assert(kSnapshotLegend.size() == 1337);
static_assert(ChecksumIs<Checksum(kSnapshotLegend), 3008276375>());

}  // namespace morwick

#endif
