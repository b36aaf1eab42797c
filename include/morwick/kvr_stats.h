/*
 * The KVR statistics parser. It fills the entry lists and, from the keys that tools need most,
 * summary fields that are read without searching the lists.
 *
 * The 64-bit record stream, which the FTL parser reads too, is a row of 64-bit words, each stored
 * little-endian: records laid end to end from the first word of the buffer to its last whole one,
 * without an end mark of their own.
 *
 *     word    bytes of the word   content
 *     0       0 to 3              key id
 *             4 to 7              length of the payload, in words
 *     1 on    0 to 7              the payload: value 0, value 1 and so on
 *
 * So the eight-byte value 1000 of key 4 is
 *
 *     04 00 00 00  01 00 00 00    e8 03 00 00 00 00 00 00
 *
 * and the next header begins after it. A record of length 0 is a header alone.
 *
 * Threads: no state outside the context and the buffer. One context belongs to one thread at a
 * time.
 */
#ifndef MORWICK_KVR_STATS_H
#define MORWICK_KVR_STATS_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/parser_context.h"

#ifdef __cplusplus
extern "C" {
#endif

/*
 * Owned by the caller, who fills it with zeros before its first use. Each summary field holds the
 * value of the last record of its key, an array the first ones, cut to the field's width; a key
 * that no buffer had leaves its field alone. The units are the controller's own: `hostWrites` and
 * its like count sectors. The first four fields are those of GenericParserCxt.
 */
typedef struct KVRStatsCxt {
  ContextNode *namesHead;
  ContextNode *namesTail;
  ContextNode *valuesHead;
  ContextNode *valuesTail;
  uint32_t exportVersion; /* 0 after a parse that ended at a bad header */
  int32_t parseMarker;    /* -1 after any parse, also one that failed */
  uint32_t reserved1;
  uint32_t numVirtualBlocks;
  uint32_t blocksPerVirtualBlock;
  uint32_t pagesPerVirtualBlock;
  uint32_t bytesPerPage;
  uint64_t hostReads;
  uint64_t hostWrites;
  uint64_t numFreeVirtualBlocks;
  uint64_t wearLevMoves;
  uint64_t nandReads;
  uint64_t nandWrites;
  uint64_t bandErases;
  uint64_t reserved2[3];
  uint64_t IND_pool_free;
  uint64_t IND_pool_count;
  uint64_t utilFormatTime;
  uint64_t numSleepOps;
  uint64_t maxHighEnduranceBlockErases;
  uint64_t readCountHisto[5];
  uint64_t reserved3[2];
} KVRStatsCxt;

/*
 * Parses `size` bytes of 64-bit statistics records (any alignment; bytes after the last whole
 * 64-bit word are ignored) and appends to whatever the context holds. An array's elements are named
 * by the key's name followed directly by the index. The key, not the record's length, decides how
 * many values are read: for a record that is too short they continue in the bytes after it, which
 * are still read as the next records too. Records with unknown keys, and records whose values would
 * exceed the buffer, are passed over.
 *
 * Returns 1 when the records were read to the end of the buffer. Returns 0, with everything that
 * was parsed before kept, for a buffer of fewer than 8 bytes, at a bad header (a key above
 * 0x30000000 or a length past the end; `exportVersion` is then set to 0) and when memory is
 * refused. The entry that was refused memory is missing; the later elements of its array are still
 * appended, and the records after it are not read. Its summary field is still set. A null
 * context or buffer gets 0. Error messages (error_message.h) are never recorded.
 */
MORWICK_EXPORT int KVRParseBufferToCxt(KVRStatsCxt *ctx, const void *buffer, uint32_t size);

/* Frees all entries and fills the whole context with zeros, ready for use again. Null: nothing. */
MORWICK_EXPORT void KVRReleaseContext(KVRStatsCxt *ctx);

#ifdef __cplusplus
}
#endif

#endif
