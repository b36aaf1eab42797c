// The sub-commands of morwick, each in a file of its own and one line here.
#ifndef TOOLS_COMMANDS_H
#define TOOLS_COMMANDS_H

#include <CLI/CLI.hpp>
#include <functional>

#include "tools/io.h"

namespace tools {

// What a sub-command does once its options are read; the exit status comes of it.
using Action = std::function<Status()>;

// The sub-commands, in the order of the help. For each there is a function, AddFind and so on,
// which adds it to the program and sets the action when it is what was asked for.
#define FOR_EACH_COMMAND(COMMAND) \
  COMMAND(Find)                   \
  COMMAND(Stats)                  \
  COMMAND(Diff)                   \
  COMMAND(Watch)                  \
  COMMAND(Table)                  \
  COMMAND(Snapshot)               \
  COMMAND(Read)                   \
  COMMAND(Metrics)                \
  COMMAND(Capacity)

#define DECLARE(name) void Add##name(CLI::App &app, Action *action);
FOR_EACH_COMMAND(DECLARE)
#undef DECLARE

}  // namespace tools

#endif
