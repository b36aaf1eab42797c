// What changed between two readings of the same statistics.
#ifndef TOOLS_CHANGES_H
#define TOOLS_CHANGES_H

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "tools/statistics.h"

namespace tools {

// An entry in both readings, or in only one of them.
struct Change {
  std::optional<Entry> old;
  std::optional<Entry> now;

  // The cells of a row: name, old, new, difference, rate and remark ("backwards", "appeared" or
  // "vanished"). `seconds` lie between the readings. A cell without a value is empty.
  std::vector<std::string> Cells(std::optional<double> seconds) const;
};

// The changes in the order of the later reading, then the entries that vanished. The n-th entry of
// a name is compared with the n-th entry of that name. Without `all`, unchanged entries are left
// out. The changes point into both statistics, which must live longer. When memory is refused it
// complains about `subject`, the name of the later reading, and returns nothing.
std::optional<std::vector<Change>> FindChanges(const Statistics &old, const Statistics &now,
                                               bool all, const std::string &subject);

// The lines of a table with the columns name, old, new, difference, rate (if the time between the
// readings is known) and remark. No lines, not even a heading, when nothing changed.
std::vector<std::string> TableOf(const std::vector<Change> &changes, std::optional<double> seconds);

// The members "seconds" and "changes".
void PrintChanges(Json &json, const std::vector<Change> &changes, std::optional<double> seconds);

}  // namespace tools

#endif
