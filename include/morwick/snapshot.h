/*
 * Controller snapshots as text. A snapshot is a series of records of one size, one for each time
 * interval. All numbers in records and headers are little-endian, whatever the host; any alignment
 * will do.
 *
 * Threads: the functions keep no state of their own, take no lock and use no heap. Renderings with
 * buffers and state words of their own may run at the same time.
 */
#ifndef MORWICK_SNAPSHOT_H
#define MORWICK_SNAPSHOT_H

#include <stdint.h>

#include "morwick/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/* The read or write operations of one priority during the interval; latencies in microseconds. */
typedef struct SnapshotOperations {
  uint32_t count;
  uint32_t totalLatency;
  uint32_t maxLatency;
} SnapshotOperations;

/* The fixed record layout, 252 bytes. The comments give the column; counts are of the interval. */
typedef struct SnapshotRecord {
  uint32_t timestamp;           /* T */
  uint32_t preemptPercent;      /* P: time in DoPreempt rather than DoNormal */
  SnapshotOperations writes[4]; /* WO, WL, WM, by priority */
  SnapshotOperations reads[4];  /* RO, RL, RM, by priority */
  uint32_t erasedBands;         /* E */
  uint32_t hostReads;           /* HR, in 4k sectors */
  uint32_t hostWrites;          /* HW, in 4k sectors */
  uint32_t nandReads;           /* NR, in 4k sectors */
  uint32_t nandWrites;          /* NW, in 4k sectors */
  uint32_t collectedSectors;    /* GC: 4k sectors completed by garbage collection */
  uint32_t unprinted1;
  uint32_t wearLevelBands; /* W */
  uint32_t unprinted2[2];
  uint32_t intermediatePendingErase; /* BI: SLC bands */
  uint32_t userPendingErase;         /* BU: MLC bands */
  uint32_t unprinted3;
  uint32_t hysteresisTime;   /* TH, in microseconds; printed in ms */
  uint32_t qosDelaysExtreme; /* H, second value */
  uint32_t qosDelaysNormal;  /* H, first value */
  uint32_t freeSegments;     /* S */
  uint32_t oldestCommandAge; /* L, first value, in ms */
  uint32_t qosInterval;      /* L, second value, in 100 us */
  uint32_t freeNodes;        /* V */
  uint32_t unprinted4;
  uint32_t bufferFragments; /* BF, first value */
  uint32_t bufferHighWater; /* BF, second value */
  uint32_t unprinted5;
  uint32_t expeditesSucceeded; /* X, first value */
  uint32_t expeditesFailed;    /* X, second value */
  uint32_t hostUnmaps;         /* U, in sectors */
  uint32_t commandTagsMin;     /* C, first value */
  uint32_t commandTagsMax;     /* C, second value */
  uint32_t unprinted6[8];
} SnapshotRecord;

/*
 * What a controller says about the layout of its snapshots:
 *
 *     offset                         size     content
 *     0                              36       SnapshotHeader
 *     36                             any      the header text, ended by a NUL
 *     descriptorTableOffset          8        SnapshotDescriptorTable
 *     descriptorTableOffset + 8      28 each  SnapshotFieldDescriptor, in print order
 */
typedef struct SnapshotHeader {
  uint32_t unused1;
  uint32_t formatVersion; /* chooses the banner: see kSnapshotFirstTextVersion */
  uint32_t recordSize;    /* bytes from one record to the next */
  uint32_t recordCount;   /* the last record is never printed, so that 0 and 1 print none */
  uint32_t unused2[2];
  uint32_t descriptorTableOffset;
  uint32_t unused3[2];
} SnapshotHeader;

/* The banner, the head of the text, is the legend below this version, else the header text. */
enum { kSnapshotFirstTextVersion = 6 };

typedef struct SnapshotDescriptorTable {
  uint32_t descriptorCount;
  uint32_t unused;
} SnapshotDescriptorTable;

/*
 * One field of a record and how to print it. Kinds: 0 and 1 a 32-bit number; 2 a 32-bit number in
 * thousandths, printed as two numbers, whole and hundredths; 3 triples of 32-bit numbers, one
 * triple for each priority. Other kinds print nothing. Kind 3 prints the format with the text "O"
 * and the first number of each triple, then the format with "L" and the second numbers, then with
 * "M" and the third ones; the numbers take at least 4, 7 and 5 characters, and a "/" stands between
 * two.
 */
typedef struct SnapshotFieldDescriptor {
  uint16_t kind;
  uint16_t unused;
  uint32_t fieldOffset; /* within the record, in bytes */
  uint32_t fieldSize;   /* in bytes; kind 3 only: 12 for each priority, a remainder is ignored */
  char format[16];      /* print format, label included, ended by a NUL */
} SnapshotFieldDescriptor;

/*
 * Renders `snapshotSize` bytes of SnapshotRecords: a legend, one line for each record and an empty
 * line.
 * Bytes after the last whole record are ignored.
 *
 * `*outputSize` is the capacity of `output` in bytes. Returns 1 and sets it to the length of the
 * text without its NUL. Returns 0 and leaves it alone when the text and its NUL do not fit:
 * `output` then holds as much of the text as fits, ended by a NUL (nothing for a capacity of 0). A
 * null pointer gets 0; `snapshot` may be null when there is not one whole record. Of the number of
 * records only the low 32 bits are used.
 */
MORWICK_EXPORT uint64_t KVRParseSnapshotBuffer(const void *snapshot, uint64_t snapshotSize,
                                               char *output, uint64_t *outputSize);

/*
 * Renders a snapshot in the layout that its header describes, through a buffer of any size, in as
 * many calls as it takes. `*state` is the index of the next record: set it to 0 before the first
 * call and keep it between calls. Before each call set `*outputSize` to the capacity of
 * `output`, in bytes; afterwards it is the length of the text of this call plus 1, for its NUL.
 *
 * Returns 1 when the last record has been dealt with, and 0 when the buffer was full: take the text
 * and call again. The record that did not fit is passed over and not printed later. A call in which
 * no line was completed yields the empty text, also where it had written the banner. While the
 * banner does not fit, every call returns 0 with the empty text and `*state` at 0. A record whose
 * first described field begins with 32 bits of 0 is empty and prints no line.
 *
 * To lose no record, ask again for the one that did not fit. After a call that completed lines set
 * `*state` back by one: the record then has the buffer to itself. After a call that completed none,
 * restore the state that it began with (at 0 the banner, dropped with the record, is written again)
 * and give more room. Without more room it would fail at the same record for ever. A hostile
 * format can ask for any room: at a bound leave the state, and the record is passed over.
 *
 *     uint64_t room = 4096;
 *     char *text = malloc(room);
 *     uint32_t state = 0;
 *     while (text != NULL) {
 *       const uint32_t start = state;
 *       uint64_t size = room;
 *       const uint64_t done = KVRParseSnapshotBufferWithInplaceParser(
 *           snapshot, snapshotSize, text, &size, header, &state);
 *       fwrite(text, 1, size - 1, stdout);
 *       if (done) break;
 *       if (size > 1) {
 *         --state;
 *       } else if (room < 8388608) {
 *         state = start;
 *         free(text);
 *         text = malloc(room *= 2);
 *       } else if (state == start) {
 *         break; // the banner does not fit
 *       }
 *     }
 *     free(text);
 *
 * A null header, output, output size or state and a capacity of 0 get 0, and nothing is touched. A
 * null snapshot has no records: the call returns 1 and the empty text if the banner fits.
 *
 * The header is not trusted, but it must be whole (ask snapshot_header.h first): its text,
 * descriptor table and descriptors are read where it says they are, the table only when a whole
 * record of 4 bytes or more is left. Nothing outside `snapshotSize` bytes is read; a record that
 * does not lie in them whole ends the rendering. A descriptor prints nothing when its field (of
 * kind 3 without the rest) lies outside the record or its format has no NUL, or asks for anything
 * that its kind does not supply: one number, for kind 2 two, by d, i, u, o, x or X; for kind 3 one
 * text by s. A field of kind 3 without priorities is the exception: nothing is read for it, so it
 * prints its three labels wherever its offset points. The flags -, 0, +, blank and #, width and
 * precision may be any, but a field wider than 2^31 - 1 characters fits no buffer. When the 32 bits
 * that mark an empty record lie outside the record, or no field is described, every record counts
 * as empty.
 */
MORWICK_EXPORT uint64_t KVRParseSnapshotBufferWithInplaceParser(const void *snapshot,
                                                                uint64_t snapshotSize, char *output,
                                                                uint64_t *outputSize,
                                                                const void *header,
                                                                uint32_t *state);

#ifdef __cplusplus
}
#endif

#endif
