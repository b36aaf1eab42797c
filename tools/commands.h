// The sub-commands of morwick, but for help, which main.cpp adds. Each has one line here and a file
// of its own.
#ifndef TOOLS_COMMANDS_H
#define TOOLS_COMMANDS_H

#include <CLI/CLI.hpp>
#include <functional>

#include "tools/output.h"

namespace tools {

// Carries out a sub-command after its options are read. Returns the exit status.
using Action = std::function<Status()>;

// The sub-commands, in the order of the help. Each has a function (AddFind, AddStats, ...) that
// adds it to the program. Where the user calls the sub-command, `*action` is set while the command
// line is parsed, and main carries it out afterwards.
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
