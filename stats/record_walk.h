/*
 * The walk over the records of a statistics dump: where the next record lies, or where the records
 * end and why. The three parsers and morwick/records.h are built on it. C11 and C++20 alike.
 * Comments that begin with an at sign are rules in ACSL: scripts/prove proves that the code keeps
 * them for any bytes of any length. There `s` is a stream, `b` its bytes and `o` an offset in them.
 * In front of a rule stand the words by which public headers tell it; scripts/lint compares them.
 */
#ifndef STATS_RECORD_WALK_H
#define STATS_RECORD_WALK_H

#include <stdint.h>

#include "morwick/little_endian.h"
#include "morwick/records.h"

enum {
  kWideHeader = 8,  /* of KVR and FTL: key, and length in words of eight bytes */
  kShortHeader = 4, /* of MSP: key, and length in bytes */
  kFTLEndId = 0xFFFF,
  kMSPEndId = 0x2FFF,
  kHighestId = 0x30000000 /* of KVR and FTL: a key above it is bad */
};

/* A record, or what ends the records. Where no whole header is left, id and length are 0. */
struct WalkedRecord {
  uint32_t id;
  uint64_t offset;  /* of the header */
  uint64_t payload; /* its offset */
  uint64_t length;  /* of the payload, in bytes */
};

/*@ logic integer HeaderSize(MorwickStream s) = s == kMorwickMSP ? 4 : 8;

    logic integer Id(MorwickStream s, uint8_t *b, integer o) =
      s == kMorwickMSP ? Number16(b, o) : Number32(b, o);

    logic integer Length(MorwickStream s, uint8_t *b, integer o) =
      s == kMorwickMSP ? Number16(b, o + 2) : 8 * Number32(b, o + 4);

    // What stands at `o`, where there is no filler.
    logic integer Step(MorwickStream s, uint8_t *b, integer size, integer o) =
      // records.h: the buffer ends right after a record, so it is whole
      o == size ? kMorwickEndOfBuffer
      // records.h: bytes are left, but fewer than a header has
      // kvr_stats.h: bytes after the last whole 64-bit word are ignored
      // msp_stats.h: where only 1 to 3 bytes are left for the next header
      : o + HeaderSize(s) > size ? kMorwickPartOfHeader
      // records.h: a record with the end key of FTL or MSP
      // ftl_stats.h: at a record of the end key 0xFFFF
      : s == kMorwickFTL && Id(s, b, o) == 0xFFFF ? kMorwickEndRecord
      // msp_stats.h: at a record of the end key 0x2FFF
      : s == kMorwickMSP && Id(s, b, o) == 0x2FFF ? kMorwickEndRecord
      // records.h: a KVR or FTL header with a key above 0x30000000
      // kvr_stats.h: a bad header (a key above 0x30000000 or a length past the end
      // ftl_stats.h: a bad header (a key above 0x30000000 or a length past the end
      : s != kMorwickMSP && Id(s, b, o) > 0x30000000 ? kMorwickBadKey
      // records.h: a record that needs more bytes than are left
      // msp_stats.h: at a record that runs past the end
      : o + HeaderSize(s) + Length(s, b, o) > size ? kMorwickTooLong
      : kMorwickRecord;

    // The offset of the first that is no filler, from `o` on. A filler is a record of length 0.
    logic integer Start(MorwickStream s, uint8_t *b, integer size, integer o) =
      // records.h: In FTL and MSP it passes over records of length 0
      // ftl_stats.h: records of length 0 are passed over
      // msp_stats.h: A record of length 0 is a filler of four bytes
      s != kMorwickKVR && o + HeaderSize(s) <= size && Length(s, b, o) == 0
        ? Start(s, b, size, o + HeaderSize(s)) : o;

    predicate Describes(struct WalkedRecord r, MorwickStream s, uint8_t *b, integer size) =
      r.offset <= r.payload <= size &&
      (r.offset + HeaderSize(s) <= size ==>
        r.payload == r.offset + HeaderSize(s) &&
        r.id == Id(s, b, r.offset) && r.length == Length(s, b, r.offset)) &&
      (r.offset + HeaderSize(s) > size ==>
        r.payload == r.offset && r.id == 0 && r.length == 0);
*/

/* The header at the offset: its id, and below the length of its payload in bytes. */
/*@ requires \valid_read(bytes + (offset .. offset + HeaderSize(stream) - 1));
    requires offset + HeaderSize(stream) <= UINT64_MAX;
    assigns \nothing;
    ensures \result == Id(stream, bytes, offset); */
static inline uint32_t HeaderId(MorwickStream stream, const uint8_t *bytes, uint64_t offset) {
  if (stream == kMorwickMSP) return LoadLittleEndian16(bytes + offset);
  return LoadLittleEndian32(bytes + offset);
}

/*@ requires \valid_read(bytes + (offset .. offset + HeaderSize(stream) - 1));
    requires offset + HeaderSize(stream) <= UINT64_MAX;
    assigns \nothing;
    ensures \result == Length(stream, bytes, offset); */
static inline uint64_t HeaderLength(MorwickStream stream, const uint8_t *bytes, uint64_t offset) {
  if (stream == kMorwickMSP) return LoadLittleEndian16(bytes + offset + 2);
  return (uint64_t)LoadLittleEndian32(bytes + offset + 4) * 8;
}

/* The step for a header that `left` bytes follow. */
/*@ assigns \nothing;
    ensures \result ==
      (stream == kMorwickFTL && id == 0xFFFF ? kMorwickEndRecord
       : stream == kMorwickMSP && id == 0x2FFF ? kMorwickEndRecord
       : stream != kMorwickMSP && id > 0x30000000 ? kMorwickBadKey
       : length > left ? kMorwickTooLong
       : kMorwickRecord); */
static inline MorwickStep StepOfHeader(MorwickStream stream, uint32_t id, uint64_t length,
                                       uint64_t left) {
  if (stream == kMorwickFTL && id == kFTLEndId) return kMorwickEndRecord;
  if (stream == kMorwickMSP && id == kMSPEndId) return kMorwickEndRecord;
  if (stream != kMorwickMSP && id > kHighestId) return kMorwickBadKey;
  return length > left ? kMorwickTooLong : kMorwickRecord;
}

/*
 * The record at the offset, or what ends the records there. Fillers, which FTL and MSP records may
 * have in front of them, are passed over.
 */
/*@ requires \valid_read(bytes + (0 .. size - 1)) && offset <= size;
    requires \valid(record) && \separated(record, bytes + (0 .. size - 1));
    requires stream == kMorwickKVR || stream == kMorwickFTL || stream == kMorwickMSP;
    assigns *record;
    ensures Describes(*record, stream, bytes, size);
    ensures record->offset == Start(stream, bytes, size, offset) && record->offset >= offset;
    ensures \result == Step(stream, bytes, size, record->offset);
    ensures \result == kMorwickRecord ==> record->payload + record->length <= size; */
static inline MorwickStep WalkToRecord(MorwickStream stream, const uint8_t *bytes, uint64_t size,
                                       uint64_t offset, struct WalkedRecord *record) {
  const uint64_t header = stream == kMorwickMSP ? kShortHeader : kWideHeader;
  /*@ loop invariant \at(offset, Pre) <= offset <= size;
      loop invariant Start(stream, bytes, size, offset) ==
        Start(stream, bytes, size, \at(offset, Pre));
      loop assigns offset, *record;
      loop variant size - offset; */
  while (size - offset >= header) {
    const uint32_t id = HeaderId(stream, bytes, offset);
    const uint64_t length = HeaderLength(stream, bytes, offset);
    if (stream == kMorwickKVR || length > 0) {
      record->id = id;
      record->offset = offset;
      record->payload = offset + header;
      record->length = length;
      return StepOfHeader(stream, id, length, size - offset - header);
    }
    offset += header;
  }
  record->id = 0;
  record->offset = offset;
  record->payload = offset;
  record->length = 0;
  return offset == size ? kMorwickEndOfBuffer : kMorwickPartOfHeader;
}

/*
 * How many of a key's configured values the parser takes from a record. KVR values may continue in
 * the records after it, and all of them are taken or none; other values must lie in the record.
 */
/*@ requires payload + length <= size;
    requires stream == kMorwickKVR || stream == kMorwickFTL || stream == kMorwickMSP;
    assigns \nothing;
    ensures payload + \result * (stream == kMorwickMSP ? 4 : 8) <= size;
    // records.h: as many as are configured, which may continue in the records after it, or none
    // kvr_stats.h: The key, not the record's length, decides how many values are read
    ensures stream == kMorwickKVR ==>
      \result == (payload + configured * 8 <= size ? configured : 0);
    // records.h: as many as both the configuration and the record have
    // ftl_stats.h: the smaller one is added
    // msp_stats.h: as many whole elements as both allow are added
    ensures stream != kMorwickKVR ==>
      \result == \min(configured, length / (stream == kMorwickMSP ? 4 : 8)); */
static inline uint32_t ValuesTaken(MorwickStream stream, uint64_t payload, uint64_t length,
                                   uint64_t size, uint32_t configured) {
  const uint64_t width = stream == kMorwickMSP ? 4 : 8;
  const uint64_t room = (stream == kMorwickKVR ? size - payload : length) / width;
  if (configured <= room) return configured;
  return stream == kMorwickKVR ? 0 : (uint32_t)room;
}

#endif
