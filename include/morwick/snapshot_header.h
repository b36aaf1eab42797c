/*
 * Checks whether a snapshot header is whole. A header comes from a controller or a file and may be
 * damaged or hostile, so check it before snapshot.h or anything else follows its offsets.
 *
 * Threads: may be called from any thread.
 */
#ifndef MORWICK_SNAPSHOT_HEADER_H
#define MORWICK_SNAPSHOT_HEADER_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/snapshot.h"

#ifdef __cplusplus
extern "C" {
#endif

/* The first fault of a header, in this order. */
typedef enum MorwickHeaderFault {
  kMorwickHeaderIsWhole,
  kMorwickHeaderTooShort,     /* fewer bytes than SnapshotHeader has, or a null pointer */
  kMorwickHeaderNoRecordSize, /* the record size is 0 */
  kMorwickHeaderNoTextEnd,    /* the format version asks for a header text, which has no NUL */
  kMorwickHeaderNoTable,      /* the descriptor table is not within `size` */
  kMorwickHeaderNoDescriptors /* not all descriptors are within `size` */
} MorwickHeaderFault;

/* Room for every text of MorwickCheckSnapshotHeader, with its NUL. */
enum { kMorwickHeaderTextRoom = 120 };

/*
 * Checks a header of `size` bytes, of any alignment: the header text (where the format version asks
 * for it), the descriptor table and the descriptors must lie inside, and records must have a size.
 * Formats and fields need no check: the functions of snapshot.h check them before they print.
 * Returns the first fault. If `text` is not null, the fault is also written there in a few words
 * with the bad value: at most kMorwickHeaderTextRoom bytes with the NUL, the empty text for a whole
 * header.
 */
MORWICK_EXPORT MorwickHeaderFault MorwickCheckSnapshotHeader(const void *header, uint64_t size,
                                                             char *text);

#ifdef __cplusplus
}
#endif

#endif
