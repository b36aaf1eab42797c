#define _GNU_SOURCE

// Preloaded into a process under attack: refuses the allocation with the number in REFUSE, counted
// from 1, and leaves the number of all allocations in the file named by ALLOCATIONS. In the unit
// tests the functions have other names, to which the linker redirects calls (--wrap).

#include <errno.h>
#include <sched.h>
#include <stdatomic.h>
#include <stdio.h>
#include <stdlib.h>

static atomic_ulong count;
static unsigned long refused;

void *__libc_malloc(size_t size);
void *__libc_calloc(size_t number, size_t size);
void *__libc_realloc(void *block, size_t size);

static int Refuses(void) {
  if (++count != refused) return 0;
  errno = ENOMEM;
  return 1;
}

void *malloc(size_t size) { return Refuses() ? NULL : __libc_malloc(size); }

void *calloc(size_t number, size_t size) {
  sched_yield();  // lets other threads reach this point, so that a race shows
  return Refuses() ? NULL : __libc_calloc(number, size);
}

void *realloc(void *block, size_t size) { return Refuses() ? NULL : __libc_realloc(block, size); }

/* Counts anew, and refuses the allocation with this number. Returns the count so far. */
unsigned long RefuseAllocation(unsigned long number) {
  refused = number;
  return atomic_exchange(&count, 0);
}

__attribute__((constructor)) static void Begin(void) {
  const char *number = getenv("REFUSE");
  refused = number == NULL ? 0 : strtoul(number, NULL, 10);
  count = 0;
}

__attribute__((destructor)) static void End(void) {
  const char *name = getenv("ALLOCATIONS");
  const unsigned long total = count;
  FILE *file = name == NULL ? NULL : fopen(name, "w");
  if (file == NULL) return;
  fprintf(file, "%lu", total);
  fclose(file);
}
