/*
 * The result of the statistics parsers: named values in the order in which they were found, as two
 * lists that run side by side. The n-th name node and the n-th value node are the n-th entry; the
 * same name may occur more than once.
 *
 * Threads: no function here has state of its own or takes a lock. One context belongs to one thread
 * at a time; different contexts may be used at the same time.
 */
#ifndef MORWICK_PARSER_CONTEXT_H
#define MORWICK_PARSER_CONTEXT_H

#include <stdint.h>

#include "morwick/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/* One list node. The nodes belong to their context; never free or relink one. */
typedef struct ContextNode {
  char text[100]; /* the name, or the value in decimal; ended by a NUL, at most 98 characters */
  uint64_t value; /* the value; 0 in a name node */
  struct ContextNode *next; /* null in the last node */
} ContextNode;

/* Owned by the caller, who fills it with zeros before its first use. Empty: all four are null. */
typedef struct GenericParserCxt {
  ContextNode *namesHead;
  ContextNode *namesTail;
  ContextNode *valuesHead;
  ContextNode *valuesTail;
} GenericParserCxt;

/*
 * Appends one entry named `prefix` followed directly by `name`, cut to 98 characters. The texts are
 * copied. Returns 1, or 0 when a pointer is null or memory is refused; nothing was added then.
 */
MORWICK_EXPORT int AddSingleValueToGenericContext(GenericParserCxt *ctx, const char *prefix,
                                                  const char *name, uint64_t value);

/*
 * Appends one entry for each of `count` little-endian unsigned integers of `width` bytes that lie
 * back to back at `src`, on any alignment. They are named `fieldName` followed by their index from
 * 0; a single one is named `fieldName` alone. Returns 1 when every element was added or `width` or
 * `count` is 0. Returns 0 with nothing added for a null pointer, a width above 8 or a count above
 * 65535, and 0 when memory was refused for an element; the other elements are added then.
 */
MORWICK_EXPORT int AddMultipleFieldsToGenericContext(GenericParserCxt *ctx, const char *fieldName,
                                                     const void *src, uint32_t width,
                                                     uint32_t count);

/* Frees all entries and leaves the context empty, ready for use again. Null: does nothing. */
MORWICK_EXPORT void ReleaseGenericParserCxt(GenericParserCxt *ctx);

#ifdef __cplusplus
}
#endif

#endif
