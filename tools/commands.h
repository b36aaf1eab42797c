// The sub-commands of morwick. Each returns the exit status.
#ifndef TOOLS_COMMANDS_H
#define TOOLS_COMMANDS_H

#include <cstdint>
#include <string>
#include <vector>

#include "tools/io.h"

namespace tools {

// Finds and opens the controller, says what it is and offers, closes it.
Status FindCommand();

struct StatsOptions {
  std::string file;
  std::string stream;      // kvr, ftl or msp
  std::string controller;  // class name; the first row of the table when empty
  std::string format = "normal";
};
Status StatsCommand(const StatsOptions &options);

struct SnapshotOptions {
  std::string file;
  std::string header;  // the fixed layout when empty
  std::string format = "normal";
};
Status SnapshotCommand(const SnapshotOptions &options);

Status CapacityCommand(const std::vector<uint32_t> &megabytes);

}  // namespace tools

#endif
