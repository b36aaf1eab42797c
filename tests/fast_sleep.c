#define _DEFAULT_SOURCE

// Preloaded into a process under test: its pauses last milliseconds instead of seconds.

#include <unistd.h>

unsigned sleep(unsigned seconds) {
  usleep(seconds * 1000);
  return 0;
}
