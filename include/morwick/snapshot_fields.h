/*
 * The fields of snapshot records as data: which numbers a record has, where they lie, and what they
 * are called. They are the fields that a header describes, or those of the fixed layout, and the
 * renderings of snapshot.h print the same ones.
 *
 *     MorwickSnapshotField field;
 *     for (uint32_t i = 0; MorwickSnapshotFieldAt(header, i, &field); ++i) {
 *       if (field.kind == kMorwickFieldNumber || field.kind == kMorwickFieldThousandths) {
 *         const uint32_t number = LoadLittleEndian32(record + field.offset); // little_endian.h
 *         printf("%s %u\n", field.names[0].column, number);
 *       }
 *     }
 *
 * Threads: may be called from any thread. No memory is taken.
 */
#ifndef MORWICK_SNAPSHOT_FIELDS_H
#define MORWICK_SNAPSHOT_FIELDS_H

#include <stdint.h>

#include "morwick/export.h"
#include "morwick/snapshot.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef enum MorwickFieldKind {
  kMorwickFieldWithoutNumber, /* its descriptor prints nothing, or text alone */
  kMorwickFieldNumber,        /* 32 bits without a sign, whatever the format prints */
  kMorwickFieldThousandths,   /* 32 bits, stored in thousandths of what is printed */
  kMorwickFieldPriorities     /* SnapshotOperations, one for each priority */
} MorwickFieldKind;

/* Room for every name, with its NUL. */
enum { kMorwickFieldNameRoom = 32 };

/*
 * Two names of a number. No two numbers of a layout have the same label.
 *
 * The label is the text before the number, without blanks and signs at its ends: TH for the format
 * " TH=%8u.%02u". Signs are all characters but letters, digits, "_" and bytes above 127. A number
 * without a label is named by its offset, at_168. A label that came before gets a number, X_2;
 * where the layout has labels such as X_7 itself, numbers go on from there, X_8.
 *
 * The column is the label, or a name that says more where the fixed layout has a field of that kind
 * and label: TH_us for TH, BF_fragments for BF, and BF_high_water for the number that a format such
 * as "/%2u" prints right after BF. For a repeated label, and for the number right after it, the
 * column is the label.
 */
typedef struct MorwickFieldName {
  char label[kMorwickFieldNameRoom];
  char column[kMorwickFieldNameRoom];
} MorwickFieldName;

typedef struct MorwickSnapshotField {
  MorwickFieldKind kind;
  uint32_t offset;     /* of its first number in a record, in bytes, as the descriptor says */
  uint32_t priorities; /* at least 1 for kMorwickFieldPriorities, else 0 */
  /* One number has names[0]. Priorities have the names of count, total latency and maximum latency:
   * RO, RL and RM for the format " R%s=". The others are empty. */
  MorwickFieldName names[3];
} MorwickSnapshotField;

/*
 * Sets `*field` to the field with that index, counted from 0 in print order, and returns 1. Returns
 * 0, and leaves it alone, after the last one. A null header stands for the fixed layout; any other
 * must have passed MorwickCheckSnapshotHeader, and may have any alignment. A null field gets 0.
 *
 * A field whose kind is not kMorwickFieldWithoutNumber lies in the records that the header
 * describes. The number at the offset of field 0 is 0 in an empty record, whatever the kind of the
 * field; that offset may lie outside.
 *
 * Each name is compared with all others. A hostile header of 1 MiB has 37,000 descriptors, and all
 * its fields take minutes: refuse such a header first.
 */
MORWICK_EXPORT int MorwickSnapshotFieldAt(const void *header, uint32_t index,
                                          MorwickSnapshotField *field);

#ifdef __cplusplus
}
#endif

#endif
