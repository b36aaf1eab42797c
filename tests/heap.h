// The heap as tests need it: allocations are counted and can be refused, and buffers end where
// their allocation ends, so that AddressSanitizer sees one byte too many.
#ifndef TESTS_HEAP_H
#define TESTS_HEAP_H

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

// Refuses the n-th allocation from now, counted from 1; 0 refuses none.
void RefuseAllocation(size_t number);

// malloc, calloc and realloc calls since the last RefuseAllocation.
size_t AllocationCount();

// A copy of the bytes at the very end of an allocation, `shift` bytes off its aligned start.
class ExactBuffer {
 public:
  explicit ExactBuffer(std::string_view bytes, size_t shift = 0)
      : memory_(new char[bytes.size() + shift]), start_(memory_.get() + shift) {
    bytes.copy(start_, bytes.size());
  }
  char *data() const { return start_; }

 private:
  std::unique_ptr<char[]> memory_;
  char *start_;
};

#endif
