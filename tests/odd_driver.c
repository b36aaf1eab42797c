// Preloaded into a process under test: drivers that break the contract. They refuse a connection
// and leave a handle, or with ODD=empty open one without a handle.

#include <stdio.h>
#include <stdlib.h>

#include "morwick/platform.h"

int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection) {
  (void)service, (void)type;
  const int isEmpty = getenv("ODD") != NULL;
  *connection = isEmpty ? 0 : 77;
  return isEmpty ? 0 : -7;
}

int32_t CloseService(uint32_t connection) {
  fprintf(stderr, "closed %u\n", connection);
  return 0;
}
