/*
 * What scripts/prove proves besides the walk itself: the loop that every caller runs. It ends for
 * any bytes, and it ends where the rules say.
 */
/*@ // What the provers need to know of shifts, proved first.
    lemma shift_8: \forall integer x; x << 8 == x * 0x100;
    lemma shift_16: \forall integer x; x << 16 == x * 0x10000;
    lemma shift_24: \forall integer x; x << 24 == x * 0x1000000;
    lemma shift_32: \forall integer x; x << 32 == x * 0x100000000;
    lemma shift_40: \forall integer x; x << 40 == x * 0x10000000000;
    lemma shift_48: \forall integer x; x << 48 == x * 0x1000000000000;
    lemma shift_56: \forall integer x; x << 56 == x * 0x100000000000000; */

#include "stats/record_walk.h"

/*@ // Where the header stands that comes after the record at `o`.
    logic integer After(MorwickStream s, uint8_t *b, integer o) = o + HeaderSize(s) + Length(s, b,
   o);

    // Where the records end, from `o` on.
    logic integer End(MorwickStream s, uint8_t *b, integer size, integer o) =
      Step(s, b, size, Start(s, b, size, o)) == kMorwickRecord
        ? End(s, b, size, After(s, b, Start(s, b, size, o))) : Start(s, b, size, o); */

/*@ requires \valid_read(bytes + (0 .. size - 1));
    requires \valid(record) && \separated(record, bytes + (0 .. size - 1));
    requires stream == kMorwickKVR || stream == kMorwickFTL || stream == kMorwickMSP;
    assigns *record;
    ensures Describes(*record, stream, bytes, size);
    ensures record->offset == End(stream, bytes, size, 0);
    ensures \result == Step(stream, bytes, size, record->offset) && \result != kMorwickRecord; */
MorwickStep WalkToEnd(MorwickStream stream, const uint8_t *bytes, uint64_t size,
                      struct WalkedRecord *record) {
  uint64_t offset = 0;
  /*@ loop invariant offset <= size;
      loop invariant End(stream, bytes, size, offset) == End(stream, bytes, size, 0);
      loop assigns offset, *record;
      loop variant size - offset; */
  for (;;) {
    const MorwickStep step = WalkToRecord(stream, bytes, size, offset, record);
    if (step != kMorwickRecord) return step;
    /*@ assert record->payload + record->length == After(stream, bytes, record->offset); */
    offset = record->payload + record->length;
  }
}
