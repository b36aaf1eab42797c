// Memory of the morwick command.

#include "tools/memory.h"

#include <sys/mman.h>
#include <sys/resource.h>

#include <atomic>
#include <new>
#include <utility>

namespace tools {
namespace {

constexpr rlim_t kMemoryLimit = 1 << 30;

// Several threads may be refused memory at once.
std::atomic<bool> refused = false;
std::atomic<bool> refusalTaken = false;
MemoryReserve *held = nullptr;

void OnRefusal() {
  if (held == nullptr) ThrowOutOfMemory();
  RememberMemoryRefusal();
  held->GiveUp();
}

}  // namespace

void LimitMemory() {
  std::set_new_handler(OnRefusal);
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)  // sanitizers need more
  rlimit limit = {};
  if (getrlimit(RLIMIT_AS, &limit) != 0 || limit.rlim_cur <= kMemoryLimit) return;
  limit.rlim_cur = kMemoryLimit;
  setrlimit(RLIMIT_AS, &limit);
#endif
}

void RememberMemoryRefusal() {
  refused = true;
  refusalTaken = false;
}

void ThrowOutOfMemory() {
  RememberMemoryRefusal();
  throw std::bad_alloc();
}

bool MemoryWasRefused() { return refused; }

bool TakeMemoryRefusal() { return refused && !refusalTaken.exchange(true); }

// The limit counts address space, so pages that cannot be touched are enough and cost no memory.
// They come from the system, because a heap that was full may have no block of that size left.
MemoryReserve::MemoryReserve(size_t size)
    : room_(mmap(nullptr, size, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0)), size_(size) {
  if (IsHeld()) held = this;
}

bool MemoryReserve::IsHeld() const { return room_ != MAP_FAILED; }

void MemoryReserve::GiveUp() {
  if (!IsHeld()) return;
  held = nullptr;
  munmap(std::exchange(room_, MAP_FAILED), size_);
}

}  // namespace tools
