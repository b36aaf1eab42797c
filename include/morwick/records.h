/*
 * The walk over the records of a statistics dump, one after the other: where each one lies, what a
 * parser makes of it, and where the records end and why. It is for tools that want values without
 * lists: it takes no memory, keeps no state outside the reader, and records no message.
 *
 *     MorwickRecordReader reader;
 *     MorwickRecord record;
 *     MorwickStartRecords(&reader, kMorwickKVR, dump, size);
 *     while (MorwickNextRecord(&reader, &record)) {
 *       for (uint32_t i = 0; i < record.valueCount; ++i) {
 *         char name[kMorwickNameRoom];
 *         MorwickValueName(reader.stream, record.key, record.valueCount, i, name);
 *         printf("%s = %llu\n", name, (unsigned long long)MorwickValue(&record, i));
 *       }
 *     }
 *     if (record.step != kMorwickEndOfBuffer && record.step != kMorwickEndRecord) {
 *       printf("bad from offset %llu on\n", (unsigned long long)record.offset);
 *     }
 *
 * Any alignment will do. kvr_stats.h and msp_stats.h draw the records.
 *
 * Threads: all functions may be called from any thread; a reader belongs to one at a time.
 */
#ifndef MORWICK_RECORDS_H
#define MORWICK_RECORDS_H

#include <stdint.h>

#include "morwick/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/* The streams of statistics, by the parser that reads them. */
typedef enum MorwickStream { kMorwickKVR, kMorwickFTL, kMorwickMSP } MorwickStream;

/* A row of a key table. The KVR and FTL streams share one table. */
typedef struct MorwickKey {
  uint32_t id;
  const char *name;    /* ended by a NUL */
  uint32_t valueCount; /* the configured number of values: 1 for a scalar, more for an array */
  uint32_t nameLength; /* without the NUL */
} MorwickKey;

/* What the walk met: a record, or what ended it. */
typedef enum MorwickStep {
  kMorwickRecord,
  kMorwickEndOfBuffer,  /* the buffer ends right after a record, so it is whole */
  kMorwickEndRecord,    /* a record with the end key of FTL or MSP */
  kMorwickBadKey,       /* a KVR or FTL header with a key above 0x30000000 */
  kMorwickTooLong,      /* a record that needs more bytes than are left */
  kMorwickPartOfHeader, /* bytes are left, but fewer than a header has */
} MorwickStep;

/*
 * A record, or what ended the walk. `values` points into the buffer. With a step other than
 * kMorwickRecord there are no values; `key` is null; and for kMorwickEndOfBuffer and
 * kMorwickPartOfHeader `id` and `length` are 0. For kMorwickPartOfHeader `left` counts the bytes of
 * that part.
 */
typedef struct MorwickRecord {
  MorwickStep step;
  uint32_t id;
  uint64_t offset;         /* of its header in the buffer, in bytes */
  uint64_t length;         /* of its payload, in bytes, as the header says */
  uint64_t left;           /* bytes in the buffer after its header */
  uint64_t following;      /* bytes in the buffer after the record; 0 when it is too long */
  const MorwickKey *key;   /* null for a key that the table does not know */
  const void *values;      /* the first value, little-endian */
  uint32_t valueWidth;     /* bytes of a value: 8, for MSP 4 */
  uint32_t valueCount;     /* values that the parser takes; 0 for an unknown key */
  uint32_t recordedValues; /* whole values that the record has room for */
  uint32_t lengthDiffers; /* 1 where the parser reports that the length is not the configured one */
} MorwickRecord;

/* Owned by the caller. Its fields may be read; MorwickStartRecords sets them. */
typedef struct MorwickRecordReader {
  const uint8_t *buffer;
  uint64_t size;
  uint64_t offset; /* of the next header */
  MorwickStream stream;
} MorwickRecordReader;

/*
 * Sets the reader to the first record of `size` bytes, which must stay as they are until the walk
 * has ended. A null buffer and an unknown stream are walked as a buffer without bytes. Unlike
 * KVRMSPParseBufferToCxt the walk uses all 64 bits of the size.
 */
MORWICK_EXPORT void MorwickStartRecords(MorwickRecordReader *reader, MorwickStream stream,
                                        const void *buffer, uint64_t size);

/*
 * Sets `*record` to the next record and returns 1. At the end it sets `*record` to what ended the
 * walk and returns 0, now and at each later call. In FTL and MSP it passes over records of length
 * 0, as the parsers do. With a null pointer it returns 0 and sets nothing.
 *
 * The values are those that the stream's parser takes: of a KVR record as many as are configured,
 * which may continue in the records after it, or none when they would exceed the buffer;
 * of an FTL or MSP record as many as both the configuration and the record have.
 */
MORWICK_EXPORT int MorwickNextRecord(MorwickRecordReader *reader, MorwickRecord *record);

/* The value with that index, counted from 0; 0 when the record has no such value. */
MORWICK_EXPORT uint64_t MorwickValue(const MorwickRecord *record, uint32_t index);

/* Room for every name, with its NUL. */
enum { kMorwickNameRoom = 100 };

/*
 * Writes the name under which a parser adds the value with that index of a record of `valueCount`
 * values, at most kMorwickNameRoom bytes with the NUL, and returns its length without the NUL. The
 * index is not compared with `valueCount`. For a null key it returns 0 and writes an empty name;
 * for a null name it returns 0.
 */
MORWICK_EXPORT uint32_t MorwickValueName(MorwickStream stream, const MorwickKey *key,
                                         uint32_t valueCount, uint32_t index, char *name);

/* The number of keys of a stream; 0 for an unknown one. */
MORWICK_EXPORT uint32_t MorwickKeyCount(MorwickStream stream);

/* The key with that index in id order, counted from 0; null after the last one. */
MORWICK_EXPORT const MorwickKey *MorwickKeyAt(MorwickStream stream, uint32_t index);

/* The key of that name, letter for letter; null when there is none, or for a null name. */
MORWICK_EXPORT const MorwickKey *MorwickFindKey(MorwickStream stream, const char *name);

#ifdef __cplusplus
}
#endif

#endif
