// The heap as tests need it: allocations are counted and can be refused, and buffers end where
// their allocation ends, so that AddressSanitizer sees one byte too many. It sees every leak, too.
#ifndef TESTS_HEAP_H
#define TESTS_HEAP_H

#include <string>
#include <vector>

// Refuses the n-th allocation from now, counted from 1; 0 refuses none. Returns how many there were
// since the last call, those with new included.
extern "C" unsigned long RefuseAllocation(unsigned long number);

// A copy of the bytes that begins at index 1, so that it is never aligned, and ends with the
// allocation.
std::vector<char> Unaligned(const std::string &bytes);

#endif
