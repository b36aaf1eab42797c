#define _GNU_SOURCE

// Preloaded into a process under test: drivers that break the contract. They refuse a connection
// and leave a handle, or with ODD=HANDLE open one of that number, which may be 0. They keep no
// lock, answer a request when a byte comes on standard input, and close with a positive result.
// Once the process has looked at a pipe, the file "file" takes the place of the pipe "pipe".

#include <fcntl.h>
#include <stdio.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include "morwick/platform.h"

int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection) {
  (void)service, (void)type;
  const char *handle = getenv("ODD");
  *connection = handle != NULL ? (uint32_t)atoi(handle) : 77;
  return handle != NULL ? 0 : -7;
}

int32_t CallStructMethod(uint32_t connection, uint32_t selector, const void *input,
                         size_t inputSize, void *reply, size_t *replySize) {
  (void)connection, (void)selector, (void)input, (void)inputSize, (void)reply;
  char byte = '?';
  *replySize = 0;
  const int isAnswered = write(STDIN_FILENO, &byte, 1) == 1 && read(STDIN_FILENO, &byte, 1) == 1;
  fprintf(stderr, "answered\n");
  return isAnswered ? -8 : -9;
}

int32_t CloseService(uint32_t connection) {
  fprintf(stderr, "closed %u\n", connection);
  return 9;
}

int fstat(int descriptor, struct stat *status) {
  const int result = fstatat(descriptor, "", status, AT_EMPTY_PATH);
  if (result == 0 && S_ISFIFO(status->st_mode)) rename("file", "pipe");
  return result;
}
