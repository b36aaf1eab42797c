// A context's entries as text, with what must hold for any context checked.
#ifndef TESTS_ENTRIES_H
#define TESTS_ENTRIES_H

#include <string>

#include "morwick/parser_context.h"

struct Entries {
  std::string text;  // "name=value " for each entry
  size_t count = 0;
  bool sound =
      true;  // lists of equal length whose tails are the last nodes; texts that say the values

  template <typename Context>
  explicit Entries(const Context &context) {
    const ContextNode *name = context.namesHead;
    const ContextNode *value = context.valuesHead;
    const ContextNode *lastName = nullptr;
    const ContextNode *lastValue = nullptr;
    for (; name != nullptr && value != nullptr; name = name->next, value = value->next, ++count) {
      sound = sound && value->text == std::to_string(value->value) && name->value == 0;
      text.append(name->text).append("=").append(value->text).append(" ");
      lastName = name;
      lastValue = value;
    }
    sound = sound && name == nullptr && value == nullptr && context.namesTail == lastName &&
            context.valuesTail == lastValue;
  }
};

#endif
