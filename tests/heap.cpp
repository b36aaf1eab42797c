#include "tests/heap.h"

#include <atomic>
#include <cstdlib>

// The linker sends the calls of everything under test here (--wrap).
// NOLINTBEGIN(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the linker gives these
// names
extern "C" {
void *__real_malloc(size_t size);
void *__real_calloc(size_t count, size_t size);
void *__real_realloc(void *block, size_t size);
void *__wrap_malloc(size_t size);
void *__wrap_calloc(size_t count, size_t size);
void *__wrap_realloc(void *block, size_t size);
}

namespace {

std::atomic<size_t> allocations = 0;
std::atomic<size_t> refused = 0;

bool Refuses() { return ++allocations == refused; }

}  // namespace

void RefuseAllocation(size_t number) {
  refused = number;
  allocations = 0;
}

size_t AllocationCount() { return allocations; }

void *__wrap_malloc(size_t size) { return Refuses() ? nullptr : __real_malloc(size); }

void *__wrap_calloc(size_t count, size_t size) {
  return Refuses() ? nullptr : __real_calloc(count, size);
}

void *__wrap_realloc(void *block, size_t size) {
  return Refuses() ? nullptr : __real_realloc(block, size);
}
// NOLINTEND(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)
