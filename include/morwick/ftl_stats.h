/*
 * The FTL statistics parser: the 64-bit record stream that kvr_stats.h draws, read more strictly.
 *
 * Threads: no state outside the context and the buffer, but for the library's error message. One
 * context belongs to one thread at a time.
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
 * Returns the number of scalar records read plus the number of array elements added. Parsing ends
 * at the end of the buffer, at a record of the end key 0xFFFF, at a bad header (a key above
 * 0x30000000 or a length past the end), and when an array could not be added; what was parsed
 * before is kept, and so are those elements of that last array that could be added, though they
 * are not counted. Unknown keys are passed over, and so are records of length 0, whatever their
 * key.
 *
 * Messages (error_message.h) are recorded for a scalar that could not be added (it is counted all
 * the same), for an array whose length differs from its configured one (the smaller number is
 * added), and for an array that could not be added. With a null context nothing can be added; a
 * null buffer gets 0.
 */
MORWICK_EXPORT uint32_t KVRFTLParseBufferToCxt(GenericParserCxt *ctx, const void *buffer,
                                               uint32_t size);

#ifdef __cplusplus
}
#endif

#endif
