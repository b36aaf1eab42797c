/*
 * The numbers that controllers write and read: little-endian, at any alignment, whatever the host.
 * Comments that begin with an at sign are rules; scripts/prove proves that the code keeps them.
 *
 * Threads: pure functions, callable from any thread. The bytes must be readable.
 */
#ifndef MORWICK_LITTLE_ENDIAN_H
#define MORWICK_LITTLE_ENDIAN_H

#include <stdint.h>

#ifdef __FRAMAC__ /* the prover cannot follow a cast from void, so for it the bytes are uint8_t */
typedef uint8_t MorwickBytes;
#else

/* Bytes at any address. */
typedef void MorwickBytes;

#endif

/*@ logic integer Number16(uint8_t *b, integer o) = b[o] + 0x100 * b[o + 1];
    logic integer Number32(uint8_t *b, integer o) = Number16(b, o) + 0x10000 * Number16(b, o + 2);
*/

/* The number that the bytes hold. Compilers turn the sum into one load. */
/*@ requires \valid_read(bytes + (0 .. 1));
    assigns \nothing;
    ensures \result == Number16(bytes, 0); */
static inline uint16_t LoadLittleEndian16(const MorwickBytes *bytes) {
  const uint8_t *b = (const uint8_t *)bytes;
  return (uint16_t)(b[0] + ((uint32_t)b[1] << 8));
}

/*@ requires \valid_read(bytes + (0 .. 3));
    assigns \nothing;
    ensures \result == Number32(bytes, 0); */
static inline uint32_t LoadLittleEndian32(const MorwickBytes *bytes) {
  const uint8_t *b = (const uint8_t *)bytes;
  return b[0] + ((uint32_t)b[1] << 8) + ((uint32_t)b[2] << 16) + ((uint32_t)b[3] << 24);
}

/*@ requires \valid_read(bytes + (0 .. 7));
    assigns \nothing;
    ensures \result == Number32(bytes, 0) +
      0x100000000 * Number32(bytes, 4); */
static inline uint64_t LoadLittleEndian64(const MorwickBytes *bytes) {
  const uint8_t *b = (const uint8_t *)bytes;
  return b[0] + ((uint64_t)b[1] << 8) + ((uint64_t)b[2] << 16) + ((uint64_t)b[3] << 24) +
         ((uint64_t)b[4] << 32) + ((uint64_t)b[5] << 40) + ((uint64_t)b[6] << 48) +
         ((uint64_t)b[7] << 56);
}

#ifndef __FRAMAC__ /* the prover cannot follow the casts here */

/* Converts to the controller's byte order or back: swaps the bytes on a big-endian host only. */
static inline uint16_t LittleEndian16(uint16_t value) { return LoadLittleEndian16(&value); }
static inline uint32_t LittleEndian32(uint32_t value) { return LoadLittleEndian32(&value); }
static inline uint64_t LittleEndian64(uint64_t value) { return LoadLittleEndian64(&value); }

#endif

#endif
