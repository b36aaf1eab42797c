#include "tests/heap.h"

#include <atomic>
#include <cstdlib>
#include <thread>

namespace {

std::atomic<size_t> allocations = 0;
std::atomic<size_t> refused = 0;

}  // namespace

void RefuseAllocation(size_t number) {
  refused = number;
  allocations = 0;
}

size_t AllocationCount() { return allocations; }

// The linker sends the calls of everything under test here (--wrap) and gives them these names.
// NOLINTBEGIN(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)
extern "C" {
void *__real_malloc(size_t size);
void *__real_calloc(size_t count, size_t size);

void *__wrap_malloc(size_t size) {
  return ++allocations == refused ? nullptr : __real_malloc(size);
}

void *__wrap_calloc(size_t count, size_t size) {
  std::this_thread::yield();  // for others to come as far: who meets here is in a race
  return ++allocations == refused ? nullptr : __real_calloc(count, size);
}
}
// NOLINTEND(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)

// Counted too, wherever it is called, the standard library's own code included.
void *operator new(size_t size) {
  ++allocations;
  return __real_malloc(size);
}

void operator delete(void *block) noexcept { std::free(block); }

void operator delete(void *block, size_t) noexcept { std::free(block); }

std::vector<char> Unaligned(const std::string &bytes) {
  const std::string shifted = "x" + bytes;
  return {shifted.begin(), shifted.end()};
}
