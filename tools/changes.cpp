// What changed between two readings of the same statistics.

#include "tools/changes.h"

#include <cmath>
#include <new>
#include <unordered_map>

#include "tools/aligned_table.h"
#include "tools/text.h"

namespace tools {
namespace {

// The old reading's entries of one name, and how many of them the later reading has so far.
struct Occurrences {
  std::vector<Entry> entries;
  size_t met = 0;
};

void PrintNumber(Json &json, const char *key, uint64_t magnitude, std::string_view digits) {
  json.Numbers(key, false, [&](auto print) { print(magnitude, digits); });
}

void PrintEntry(Json &json, const char *key, const std::optional<Entry> &entry) {
  if (entry) PrintNumber(json, key, entry->value(), entry->digits());
}

uint64_t Magnitude(const Change &change) {
  const uint64_t old = change.old->value();
  const uint64_t now = change.now->value();
  return now < old ? old - now : now - old;
}

std::vector<Change> Compare(const Statistics &old, const Statistics &now, bool all) {
  std::unordered_map<std::string_view, Occurrences> before;
  for (const Entry &entry : old) before[entry.name()].entries.push_back(entry);
  std::vector<Change> changes;
  for (const Entry &entry : now) {
    Change change = {std::nullopt, entry};
    const auto found = before.find(entry.name());
    if (found != before.end() && found->second.met < found->second.entries.size()) {
      change.old = found->second.entries[found->second.met++];
    }
    if (all || !change.old || change.old->value() != entry.value()) changes.push_back(change);
  }
  std::unordered_map<std::string_view, size_t> passed;
  for (const Entry &entry : old) {
    if (passed[entry.name()]++ >= before[entry.name()].met) changes.push_back({entry, {}});
  }
  return changes;
}

}  // namespace

std::string_view Change::Remark() const {
  if (!old) return "appeared";
  if (!now) return "vanished";
  return now->value() < old->value() ? "backwards" : "";
}

std::string Change::Difference() const {
  if (!old || !now) return "";
  return (now->value() < old->value() ? "-" : "") + std::to_string(Magnitude(*this));
}

std::optional<double> Change::Rate(std::optional<double> seconds) const {
  if (!old || !now || !seconds) return std::nullopt;
  const auto difference = static_cast<double>(Magnitude(*this));
  const double rate = (now->value() < old->value() ? -difference : difference) / *seconds;
  return std::isfinite(rate) ? std::optional(rate) : std::nullopt;
}

std::optional<std::vector<Change>> FindChanges(const Statistics &old, const Statistics &now,
                                               bool all, const std::string &subject) {
  try {
    return Compare(old, now, all);
  } catch (const std::bad_alloc &) {
    Complain(subject, "out of memory when compared");
    return std::nullopt;
  }
}

std::vector<std::string> TableOf(const std::vector<Change> &changes,
                                 std::optional<double> seconds) {
  if (changes.empty()) return {};
  AlignedTable table(5);
  table.Add({"name", "old", "new", "difference", seconds ? "per second" : ""});
  for (const Change &change : changes) {
    const std::optional<double> rate = change.Rate(seconds);
    table.Add({std::string(change.name()), std::string(change.old ? change.old->digits() : ""),
               std::string(change.now ? change.now->digits() : ""), change.Difference(),
               rate ? ThreeDecimals(*rate) : "", std::string(change.Remark())});
  }
  return table.Lines();
}

void PrintChanges(Json &json, const std::vector<Change> &changes, std::optional<double> seconds) {
  json.Key("seconds");
  seconds ? json.Fraction(*seconds) : json.Null();
  json.Objects("changes", changes, [&](const Change &change) {
    json.Key("name");
    json.PlainText(change.name());
    PrintEntry(json, "old", change.old);
    PrintEntry(json, "new", change.now);
    if (const std::string difference = change.Difference(); !difference.empty()) {
      PrintNumber(json, "difference", Magnitude(change), difference);
    }
    if (const std::optional<double> rate = change.Rate(seconds)) {
      json.Key("rate");
      json.Fraction(*rate);
    }
    if (!change.Remark().empty()) json.Member("remark", change.Remark());
  });
}

}  // namespace tools
