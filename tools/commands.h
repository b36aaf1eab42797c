// The sub-commands of morwick, each in a file of its own: one declaration and one entry here.
#ifndef TOOLS_COMMANDS_H
#define TOOLS_COMMANDS_H

#include <CLI/CLI.hpp>
#include <functional>

#include "tools/io.h"

namespace tools {

// What a sub-command does once its options are read; the exit status comes of it.
using Action = std::function<Status()>;

// Each adds its sub-command and, when that is what was asked for, sets the action.
void AddFind(CLI::App &app, Action *action);
void AddStats(CLI::App &app, Action *action);
void AddDiff(CLI::App &app, Action *action);
void AddWatch(CLI::App &app, Action *action);
void AddSnapshot(CLI::App &app, Action *action);
void AddRead(CLI::App &app, Action *action);
void AddMetrics(CLI::App &app, Action *action);
void AddCapacity(CLI::App &app, Action *action);

constexpr void (*kCommands[])(CLI::App &, Action *) = {
    AddFind, AddStats, AddDiff, AddWatch, AddSnapshot, AddRead, AddMetrics, AddCapacity,
};

}  // namespace tools

#endif
