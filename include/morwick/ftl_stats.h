/*
 * The FTL statistics parser. It reads the 64-bit record stream that kvr_stats.h describes. Unlike
 * the KVR parser it never reads values past the end of a record, and it reports arrays of a wrong
 * length.
 *
 * Threads: no state except the context, the buffer and the library's error message. One context
 * belongs to one thread at a time.
 */
#ifndef MORWICK_FTL_STATS_H
#define MORWICK_FTL_STATS_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/parser_context.h"

#ifdef __cplusplus
extern "C" {
#endif

/*
 * Parses `size` bytes of 64-bit statistics records (any alignment; bytes after the last whole
 * 64-bit word are ignored) and appends to whatever the context holds; release it with
 * ReleaseGenericParserCxt. An array's elements are named by the key's name, an underscore and the
 * index (by name and underscore alone when the record holds just one element).
 *
 * Returns the number of scalar records read plus the number of array elements added. Records of
 * unknown keys and records of length 0 are passed over. Parsing ends at the end of the buffer, at a
 * record of the end key 0xFFFF, at a bad header (a key above 0x30000000 or a length past the end),
 * and when an element of an array could not be added: the other elements of that array are still
 * added, but none of them is counted. What was parsed before is kept.
 *
 * Messages (error_message.h) are recorded for a scalar that could not be added (it still counts),
 * for an array whose length differs from its number in the key table (the smaller one is added),
 * and for an array that could not be added. With a null context nothing is added: scalars are still
 * counted, and the first array ends the parsing. A null buffer gets 0.
 */
MORWICK_EXPORT uint32_t KVRFTLParseBufferToCxt(GenericParserCxt *ctx, const void *buffer,
                                               uint32_t size);

#ifdef __cplusplus
}
#endif

#endif
