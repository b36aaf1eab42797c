#define _GNU_SOURCE

// Preloaded into a command under test: the clock of a watch runs a thousand times faster, and so do
// its pauses. The time of day is that of NOW, in milliseconds since 1970, where that is set.

#include <poll.h>
#include <signal.h>
#include <stddef.h>
#include <stdlib.h>
#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

enum { kFaster = 1000 };

int clock_gettime(clockid_t clock, struct timespec *time) {
  const int result = (int)syscall(SYS_clock_gettime, clock, time);
  const char *now = clock == CLOCK_REALTIME ? getenv("NOW") : NULL;
  if (now != NULL) time->tv_sec = strtoll(now, NULL, 10) / 1000;
  if (now != NULL) time->tv_nsec = strtoll(now, NULL, 10) % 1000 * 1000000;
  if (clock != CLOCK_MONOTONIC || result != 0) return result;
  time->tv_sec = time->tv_sec * kFaster + time->tv_nsec / (1000000000 / kFaster);
  time->tv_nsec = time->tv_nsec % (1000000000 / kFaster) * kFaster;
  return 0;
}

int ppoll(struct pollfd *files, nfds_t count, const struct timespec *time, const sigset_t *mask) {
  struct timespec shorter = {0, 0};
  if (time != NULL) {
    shorter.tv_sec = time->tv_sec / kFaster;
    shorter.tv_nsec = time->tv_sec % kFaster * (1000000000 / kFaster) + time->tv_nsec / kFaster;
  }
  return (int)syscall(SYS_ppoll, files, count, time == NULL ? NULL : &shorter, mask, _NSIG / 8L);
}

// The name that calls have where the compiler checks the array's size.
int __ppoll_chk(struct pollfd *files, nfds_t count, const struct timespec *time,
                const sigset_t *mask, size_t size) {
  (void)size;
  return ppoll(files, count, time, mask);
}
