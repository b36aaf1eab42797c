/*
 * Rounding and advertised capacity, for tools that show storage figures.
 *
 * Threads: pure functions, callable from any thread.
 */
#ifndef MORWICK_CAPACITY_H
#define MORWICK_CAPACITY_H

#include <stdint.h>

#include "morwick/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/*
 * The value rounded to `sig` significant decimal digits, halves up. When more than 18 digits would
 * have to be dropped the result is 0; when the rounded value does not fit 64 bits it is UINT64_MAX.
 * Digits are counted in double precision: a value of 15 digits or more that is just below a power
 * of ten counts as having one digit more.
 */
MORWICK_EXPORT uint64_t roundSig(uint64_t value, uint64_t sig);

/*
 * The capacity in gigabytes that is advertised for a user capacity in megabytes: the next larger
 * power of two (0 below 512 MB), but 1536 from 1376256 up to, not including, 1770496 MB.
 */
MORWICK_EXPORT uint32_t GetUserCapacityInGB(uint32_t megabytes);

#ifdef __cplusplus
}
#endif

#endif
