// Memory of the morwick command: how much it may take, and what happens when it is refused.
#ifndef TOOLS_MEMORY_H
#define TOOLS_MEMORY_H

#include <cstddef>

namespace tools {

// Once, before anything else. From then on the command takes at most 1 GiB, so that a hostile dump
// ends with a message, or less where its caller has set a lower limit. Memory that is refused to
// C++ is remembered and ends as std::bad_alloc, unless a reserve can be given up for it.
void LimitMemory();

// For memory that is refused elsewhere than in C++'s own allocation: remembers it, and throws as
// that does.
void NoteMemoryRefusal();
[[noreturn]] void RefuseMemory();

// Whether memory was refused so far. Streams swallow the exception, and what they print is cut: at
// the end it is known all the same.
bool MemoryWasRefused();

// The same since the last call.
bool TakeMemoryRefusal();

// Room for what must be finished once it has begun, held if there is as much. It is given up for
// the first allocation of C++ that is refused meanwhile; that one is then tried again. One at a
// time.
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
