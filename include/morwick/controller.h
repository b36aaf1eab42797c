/*
 * What every tool does with a controller: ask whether a class is present, and read a buffer. The
 * connection comes from connection.h, or from OpenService (platform.h).
 *
 *     KVRConnection connection = {0};
 *     MorwickBuffer dump;
 *     if (!openKVRConnection(&connection)) return 1;
 *     const NandExporter *row = connection.exporter;
 *     if (MorwickReadBuffer(connection.connection, row, row->getStatsSelectors(), &dump) ==
 *         kMorwickRead) {
 *       row->parseBufferToCxt(&statistics, dump.bytes, (uint32_t)dump.size);
 *     }
 *     MorwickFreeBuffer(&dump);
 *     closeKVRConnection(&connection);
 *
 * Threads: the functions keep no state of their own and may be called from any thread.
 */
#ifndef MORWICK_CONTROLLER_H
#define MORWICK_CONTROLLER_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/exporter.h"
#include "morwick/little_endian.h"

#ifdef __cplusplus
extern "C" {
#endif

/*
 * The service handle of the row's driver, to be given back with ReleaseObject (platform.h), or 0
 * when none is registered or for a null pointer. Nothing is printed.
 */
MORWICK_EXPORT uint32_t MorwickFindService(const NandExporter *row);

/* A request to a driver: 24 bytes in the controller's byte order. platform.h says what it means. */
typedef struct MorwickRequest {
  uint32_t command;
  uint32_t argument;
  uint8_t reserved[16];
} MorwickRequest;

/* The request with the pair's second number as its command; the pair must not be null. */
static inline MorwickRequest MorwickMakeRequest(const SelectorPair *selectors, uint32_t argument) {
  MorwickRequest request = {0, 0, {0}};
  request.command = LittleEndian32(selectors->second);
  request.argument = LittleEndian32(argument);
  return request;
}

/* A reply must be smaller than this, 16 MiB. */
enum { kMorwickLargestReply = 16 << 20 };

typedef enum MorwickReadResult {
  kMorwickRead,         /* the buffer was read */
  kMorwickReadFailed,   /* the driver refused; `result` is its code */
  kMorwickReadTooLarge, /* the reply does not end before kMorwickLargestReply bytes */
  kMorwickReadNoMemory
} MorwickReadResult;

/* Filled by MorwickReadBuffer. The bytes are the caller's until MorwickFreeBuffer. */
typedef struct MorwickBuffer {
  void *bytes; /* null unless the buffer was read; not null for an empty one */
  uint64_t size;
  int32_t result; /* of the driver's last call; 0 for success */
} MorwickBuffer;

/*
 * Reads a buffer through a connection to the row's driver: the statistics with the pair of
 * `getStatsSelectors`, a snapshot with that of `getSnapshotSelectors` and so on. A reply that fills
 * the room may have been cut: it is asked for again with twice the room. Blocks until the
 * controller has answered. `*buffer` is set in any case, and may be freed. A null row, pair or
 * buffer fails; the buffer is then all zeros.
 */
MORWICK_EXPORT MorwickReadResult MorwickReadBuffer(uint32_t connection, const NandExporter *row,
                                                   const SelectorPair *selectors,
                                                   MorwickBuffer *buffer);

/* Frees the bytes and fills the record with zeros. Null: nothing. */
MORWICK_EXPORT void MorwickFreeBuffer(MorwickBuffer *buffer);

#ifdef __cplusplus
}
#endif

#endif
