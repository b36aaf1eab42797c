// The heap as tests need it: allocations are counted and can be refused, and buffers end where
// their allocation ends, so that AddressSanitizer sees one byte too many. It sees every leak, too.
#ifndef TESTS_HEAP_H
#define TESTS_HEAP_H

#include <string>
#include <vector>

// Refuses the n-th allocation from now, counted from 1, with malloc or calloc; 0 refuses none.
void RefuseAllocation(size_t number);

// Allocations since the last RefuseAllocation, those with new included.
size_t AllocationCount();

// A copy of the bytes from index 1 on, which is never aligned, to the very end of the allocation.
std::vector<char> Unaligned(const std::string &bytes);

#endif
