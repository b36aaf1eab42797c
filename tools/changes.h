// What changed between two readings of the same statistics.
#ifndef TOOLS_CHANGES_H
#define TOOLS_CHANGES_H

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "tools/statistics.h"

namespace tools {

// One entry in both readings, or in one only.
struct Change {
  std::optional<Entry> old;
  std::optional<Entry> now;

  std::string_view name() const { return now ? now->name() : old->name(); }
  // What is remarkable: "backwards", "appeared", "vanished", or nothing.
  std::string_view Remark() const;
  // now - old, in decimal with a sign when it is negative; empty when one of them is missing.
  std::string Difference() const;
  // The difference by second; nothing when one of them or the time is missing.
  std::optional<double> Rate(std::optional<double> seconds) const;
};

// In the order of the later reading, then what vanished. The n-th entry of a name is compared with
// the n-th of that name. Entries that did not change are left out unless `all` is wanted. The
// changes live as long as both statistics. Nothing after a complaint about `subject`, what the
// later reading is called: there was no memory for them.
std::optional<std::vector<Change>> FindChanges(const Statistics &old, const Statistics &now,
                                               bool all, const std::string &subject);

// The lines of a table with columns for name, old, new, difference, rate where the time between the
// readings is known, and remark. None without a change.
std::vector<std::string> TableOf(const std::vector<Change> &changes, std::optional<double> seconds);

// The members "seconds" and "changes".
void PrintChanges(Json &json, const std::vector<Change> &changes, std::optional<double> seconds);

}  // namespace tools

#endif
