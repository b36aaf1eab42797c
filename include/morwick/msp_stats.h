/*
 * The MSP statistics parser: counters of the NAND read path and of the device, from a stream of
 * small records with 16-bit keys and byte lengths.
 *
 * The stream is a row of records laid end to end, on any byte boundary; all numbers are
 * little-endian.
 *
 *     offset   size     content
 *     0        2        key
 *     2        2        length of the payload, in bytes
 *     4        length   the payload: of a known key, 32-bit values
 *
 * So the value 5 of key 4096 is
 *
 *     00 10  04 00  05 00 00 00
 *
 * A record of length 0 is a filler of four bytes, whatever its key. The key 0x2FFE marks a record
 * to be passed over, 0x2FFF the end.
 *
 * Threads: no state outside the context and the buffer, but for the library's error message. One
 * context belongs to one thread at a time.
 */
#ifndef MORWICK_MSP_STATS_H
#define MORWICK_MSP_STATS_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/parser_context.h"

#ifdef __cplusplus
extern "C" {
#endif

/*
 * Parses the buffer's records (any alignment) and appends to whatever the context holds; release it
 * with ReleaseGenericParserCxt. Only the low 32 bits of `size`, in bytes, are used. An array's
 * elements are named by the key's name followed directly by the index (by the name alone when the
 * record holds just one element).
 *
 * Returns the number of elements added. Parsing ends at the end of the buffer, where only 1 to 3
 * bytes are left for the next header (they are not looked at, and there is no message), at a record
 * of the end key 0x2FFF, at a record that runs past the end, and when a record could not be added;
 * what was parsed before is kept, and so are those elements of that last record that could be
 * added, though they are not counted. Unknown keys and records of length 0 are passed over.
 *
 * Messages (error_message.h) are recorded for a null buffer or a size of 0 (result 0), for a record
 * whose length differs from its configured one (as many whole elements as both allow are added),
 * and for a record that could not be added, as with a null context (a record too short for one
 * element has nothing to add, which is no failure).
 */
MORWICK_EXPORT uint64_t KVRMSPParseBufferToCxt(GenericParserCxt *ctx, const void *buffer,
                                               uint64_t size);

#ifdef __cplusplus
}
#endif

#endif
