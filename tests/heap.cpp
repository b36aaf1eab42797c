#include "tests/heap.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>

namespace {

std::atomic<size_t> allocations = 0;
std::atomic<size_t> refused = 0;
std::atomic<ptrdiff_t> blocks = 0;  // of malloc and calloc that nobody has freed

void *Counted(void *block) {
  if (block != nullptr) ++blocks;
  return block;
}

// Fails every test that leaks a block.
class LeakListener : public testing::EmptyTestEventListener {
  void OnTestStart(const testing::TestInfo &) override { before_ = blocks; }
  void OnTestEnd(const testing::TestInfo &) override {
    EXPECT_EQ(blocks, before_) << "blocks were left on the heap";
  }

  ptrdiff_t before_ = 0;
};

const bool kListening = [] {
  testing::UnitTest::GetInstance()->listeners().Append(new LeakListener);
  return true;
}();

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
void __real_free(void *block);

void *__wrap_malloc(size_t size) {
  return ++allocations == refused ? nullptr : Counted(__real_malloc(size));
}

void *__wrap_calloc(size_t count, size_t size) {
  std::this_thread::yield();  // for others to come as far: who meets here is in a race
  return ++allocations == refused ? nullptr : Counted(__real_calloc(count, size));
}

void __wrap_free(void *block) {
  if (block != nullptr) --blocks;
  __real_free(block);
}
}
// NOLINTEND(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)

// Counted too, wherever it is called, the standard library's own code included.
void *operator new(size_t size) {
  ++allocations;
  return __real_malloc(size);
}

void operator delete(void *block) noexcept { __real_free(block); }

void operator delete(void *block, size_t) noexcept { __real_free(block); }

std::vector<char> Unaligned(const std::string &bytes) {
  const std::string shifted = "x" + bytes;
  return {shifted.begin(), shifted.end()};
}
