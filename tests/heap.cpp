// Each `new`, also those in the standard library, goes by malloc here, so that RefuseAllocation
// counts it.

#include <cstdlib>
#include <new>

void *operator new(size_t size) {
  void *block = std::malloc(size);
  if (block == nullptr) throw std::bad_alloc();
  return block;
}

void operator delete(void *block) noexcept { std::free(block); }

void operator delete(void *block, size_t) noexcept { std::free(block); }
