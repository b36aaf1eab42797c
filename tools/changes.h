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

  // As texts, empty where there is none: name, old, new, difference, rate by the seconds between
  // the readings, and remark: "backwards", "appeared" or "vanished".
  std::vector<std::string> Cells(std::optional<double> seconds) const;
};

// The changes in the order of the later reading, then the entries that vanished. The n-th entry of
// a name is compared with the n-th entry of that name. Without `all`, unchanged entries are left
// out. The changes point into both statistics, which must live longer. Returns nothing after a
// complaint about `subject`, the name of the later reading: memory was refused.
std::optional<std::vector<Change>> FindChanges(const Statistics &old, const Statistics &now,
                                               bool all, const std::string &subject);

// The lines of a table with the columns name, old, new, difference, rate (if the time between the
// readings is known) and remark. No line without a change.
std::vector<std::string> TableOf(const std::vector<Change> &changes, std::optional<double> seconds);

// The members "seconds" and "changes".
void PrintChanges(Json &json, const std::vector<Change> &changes, std::optional<double> seconds);

}  // namespace tools

#endif
