// The library's one message, as tests need it: looked at and forgotten.
#ifndef TESTS_MESSAGE_H
#define TESTS_MESSAGE_H

#include <cstdlib>
#include <string>

#include "morwick/error_message.h"

inline std::string TakeMessage() {
  std::string message = GetAPIErrorMessage();
  std::free(GlobalAPIErrorMessage);
  GlobalAPIErrorMessage = nullptr;
  return message;
}

#endif
