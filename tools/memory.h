// Memory of the morwick command: its limit, and what happens when memory is refused.
#ifndef TOOLS_MEMORY_H
#define TOOLS_MEMORY_H

#include <cstddef>

namespace tools {

// Call it once, at the start. From then on the command takes at most 1 GiB, or less when its caller
// has set a lower limit: a hostile dump then ends with a message. When operator new is refused
// memory, this is remembered. A reserve, if one is held, is given up; otherwise std::bad_alloc is
// thrown.
void LimitMemory();

// For memory that is refused outside of operator new: both remember the refusal, and the second
// throws std::bad_alloc.
void RememberMemoryRefusal();
[[noreturn]] void ThrowOutOfMemory();

// Whether memory was refused so far. Ask at the end of the program: a library may swallow the
// exception and print only a part.
bool MemoryWasRefused();

// Whether memory was refused since the last call.
bool TakeMemoryRefusal();

// A reserve for work that must be finished once it has begun. When operator new is refused memory
// meanwhile, the reserve is given up and operator new tries again. Only one may exist at a time.
class MemoryReserve {
 public:
  explicit MemoryReserve(size_t size);
  ~MemoryReserve() { GiveUp(); }
  MemoryReserve(const MemoryReserve &) = delete;
  MemoryReserve &operator=(const MemoryReserve &) = delete;

  bool IsHeld() const;
  void GiveUp();

 private:
  void *room_;
  size_t size_;
};

}  // namespace tools

#endif
