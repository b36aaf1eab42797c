// The library's one error message: the first of the process wins.

#include "morwick/error_message.h"

#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>

namespace {

constexpr size_t kMessageSize = 1024;

// The exported pointer has a plain type, for C. The library uses it only through this atomic
// reference.
std::atomic_ref<char *> Stored() { return std::atomic_ref(GlobalAPIErrorMessage); }

}  // namespace

char *GlobalAPIErrorMessage = nullptr;

void SetAPIErrorMessage(const char *format, ...) {
  if (format == nullptr || Stored().load() != nullptr) return;
  char *message = static_cast<char *>(std::calloc(1, kMessageSize));
  if (message == nullptr) return;
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message, kMessageSize, format, arguments);
  va_end(arguments);
  // Stored only when it is complete, so that no reader sees half a message.
  char *none = nullptr;
  if (!Stored().compare_exchange_strong(none, message)) std::free(message);
}

const char *GetAPIErrorMessage() {
  const char *message = Stored().load();
  return message == nullptr ? "NA" : message;
}
