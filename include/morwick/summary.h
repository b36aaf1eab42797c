/*
 * The summary fields of KVRStatsCxt as a table, for tools that list all of them: which key each one
 * is set from, its name, and its values.
 *
 * Threads: all functions may be called from any thread.
 */
#ifndef MORWICK_SUMMARY_H
#define MORWICK_SUMMARY_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/kvr_stats.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef struct MorwickSummaryField {
  const char *name;    /* as in KVRStatsCxt */
  uint32_t id;         /* the key that the field is set from; it has the same name */
  uint32_t offset;     /* in KVRStatsCxt, in bytes */
  uint32_t valueWidth; /* bytes of a value: 8, or 4 for the low half of the key's value */
  uint32_t valueCount; /* 1, or more for an array */
} MorwickSummaryField;

MORWICK_EXPORT uint32_t MorwickSummaryFieldCount(void);

/* The field with that index, in the order of KVRStatsCxt, counted from 0; null after the last. */
MORWICK_EXPORT const MorwickSummaryField *MorwickSummaryFieldAt(uint32_t index);

/* A value of a context's field, by its index from 0; 0 when the field has no such value, when no
 * parsed buffer had its key, and for null pointers. */
MORWICK_EXPORT uint64_t MorwickSummaryValue(const KVRStatsCxt *ctx,
                                            const MorwickSummaryField *field, uint32_t index);

#ifdef __cplusplus
}
#endif

#endif
