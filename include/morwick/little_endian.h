/*
 * The numbers that controllers write and read: little-endian, on any alignment, whatever the host.
 *
 * Threads: pure functions, callable from any thread. The bytes must be there.
 */
#ifndef MORWICK_LITTLE_ENDIAN_H
#define MORWICK_LITTLE_ENDIAN_H

#include <stdint.h>
#include <string.h>

/* The value in the order of a controller; also back again. */
static inline uint16_t LittleEndian16(uint16_t value) {
#if __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
  return __builtin_bswap16(value);
#else
  return value;
#endif
}

static inline uint32_t LittleEndian32(uint32_t value) {
#if __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
  return __builtin_bswap32(value);
#else
  return value;
#endif
}

static inline uint64_t LittleEndian64(uint64_t value) {
#if __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
  return __builtin_bswap64(value);
#else
  return value;
#endif
}

/* The number that the bytes hold. */
static inline uint16_t LoadLittleEndian16(const void *bytes) {
  uint16_t value;
  memcpy(&value, bytes, sizeof value);
  return LittleEndian16(value);
}

static inline uint32_t LoadLittleEndian32(const void *bytes) {
  uint32_t value;
  memcpy(&value, bytes, sizeof value);
  return LittleEndian32(value);
}

static inline uint64_t LoadLittleEndian64(const void *bytes) {
  uint64_t value;
  memcpy(&value, bytes, sizeof value);
  return LittleEndian64(value);
}

#endif
