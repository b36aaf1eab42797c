// A platform without controllers. It keeps the contract: it finds no controller, it opens no
// handle, and its schedule is empty.

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "morwick/platform.h"

namespace {

constexpr int32_t kBadHandle = 1;  // any number but 0
constexpr int kActivityStateNone = 0;

}  // namespace

MatchingRequest *ServiceMatching(const char *) { return nullptr; }

uint32_t GetMatchingService(MatchingRequest *) { return 0; }

int32_t OpenService(uint32_t, uint32_t, uint32_t *connection) {
  *connection = 0;
  return kBadHandle;
}

int32_t CloseService(uint32_t) { return kBadHandle; }

int32_t ReleaseObject(uint32_t) { return kBadHandle; }

int32_t CallStructMethod(uint32_t, uint32_t, const void *, size_t, void *, size_t *replySize) {
  *replySize = 0;
  return kBadHandle;
}

void RegisterActivity(const char *, ActivityCriteria, ActivityHandler) {}

int GetActivityState(Activity *) { return kActivityStateNone; }

bool ActivityShouldDefer(Activity *) { return false; }

bool SetActivityState(Activity *, int) { return false; }

void ExitTransactionClean() {}

void RunMainQueue() {
  SystemLog("built without a platform: there is nothing to run");
  std::exit(EXIT_SUCCESS);
}

// May wait until somebody reads standard error. A platform with runs must not wait; here there is
// no run to hold up.
void SystemLog(const char *format, ...) {
  char message[1024];
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message, sizeof message, format, arguments);
  va_end(arguments);
  // Some messages end their line themselves.
  const size_t length = std::strlen(message);
  std::fprintf(stderr, "grellon: %s%s", message,
               length > 0 && message[length - 1] == '\n' ? "" : "\n");
}
