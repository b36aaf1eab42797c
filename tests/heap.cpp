#include "tests/heap.h"

#include <cstdlib>
#include <new>

// These go by malloc, so that it counts each `new`, also those in the standard library.
void *operator new(size_t size) {
  void *block = std::malloc(size);
  if (block == nullptr) throw std::bad_alloc();
  return block;
}

void operator delete(void *block) noexcept { std::free(block); }

void operator delete(void *block, size_t) noexcept { std::free(block); }

std::vector<char> Unaligned(const std::string &bytes) {
  const std::string shifted = "x" + bytes;
  return {shifted.begin(), shifted.end()};
}
