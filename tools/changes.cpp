#include "tools/changes.h"

#include <cmath>
#include <new>
#include <unordered_map>

#include "tools/aligned_table.h"
#include "tools/text.h"

namespace tools {
namespace {

// The old reading's entries of one name. The first `matched` ones are also in the later reading.
struct Occurrences {
  std::vector<Entry> entries;
  size_t matched = 0;
};

void PrintNumber(Json &json, const char *key, uint64_t magnitude, std::string_view digits) {
  json.Numbers(key, false, [&](auto print) { print(magnitude, digits); });
}

void PrintEntry(Json &json, const char *key, const std::optional<Entry> &entry) {
  if (entry) PrintNumber(json, key, entry->value(), entry->digits());
}

std::string_view NameOf(const Change &change) {
  return change.now ? change.now->name() : change.old->name();
}

bool IsBackwards(const Change &change) {
  return change.old && change.now && change.now->value() < change.old->value();
}

std::string_view RemarkOf(const Change &change) {
  if (!change.old) return "appeared";
  if (!change.now) return "vanished";
  return IsBackwards(change) ? "backwards" : "";
}

// The difference without its sign. Nothing when one of the two entries is missing.
std::optional<uint64_t> MagnitudeOf(const Change &change) {
  if (!change.old || !change.now) return std::nullopt;
  const uint64_t difference = change.now->value() - change.old->value();
  return IsBackwards(change) ? -difference : difference;
}

// The new value less the old one, with its sign. Empty when one of the two is missing.
std::string DifferenceOf(const Change &change) {
  const std::optional<uint64_t> magnitude = MagnitudeOf(change);
  return magnitude ? (IsBackwards(change) ? "-" : "") + std::to_string(*magnitude) : "";
}

// The difference per second. Nothing when it or the time is missing, or the rate is infinite.
std::optional<double> RateOf(const Change &change, std::optional<double> seconds) {
  const std::optional<uint64_t> magnitude = MagnitudeOf(change);
  if (!magnitude || !seconds) return std::nullopt;
  const double rate = static_cast<double>(*magnitude) / *seconds;
  if (!std::isfinite(rate)) return std::nullopt;
  return IsBackwards(change) ? -rate : rate;
}

}  // namespace

std::vector<std::string> Change::Cells(std::optional<double> seconds) const {
  const std::optional<double> rate = RateOf(*this, seconds);
  return {std::string(NameOf(*this)),
          std::string(old ? old->digits() : ""),
          std::string(now ? now->digits() : ""),
          DifferenceOf(*this),
          rate ? ThreeDecimals(*rate) : "",
          std::string(RemarkOf(*this))};
}

std::optional<std::vector<Change>> FindChanges(const Statistics &old, const Statistics &now,
                                               bool all, const std::string &subject) {
  try {
    std::unordered_map<std::string_view, Occurrences> before;
    for (const Entry &entry : old) before[entry.name()].entries.push_back(entry);
    std::vector<Change> changes;
    for (const Entry &entry : now) {
      Change change = {std::nullopt, entry};
      const auto found = before.find(entry.name());
      if (found != before.end() && found->second.matched < found->second.entries.size()) {
        change.old = found->second.entries[found->second.matched++];
      }
      if (all || !change.old || change.old->value() != entry.value()) changes.push_back(change);
    }
    for (const Entry &entry : old) {
      size_t &matched = before[entry.name()].matched;
      if (matched > 0) {
        --matched;
      } else {
        changes.push_back({entry, {}});
      }
    }
    return changes;
  } catch (const std::bad_alloc &) {
    Complain(subject, "out of memory while comparing");
    return std::nullopt;
  }
}

std::vector<std::string> TableOf(const std::vector<Change> &changes,
                                 std::optional<double> seconds) {
  if (changes.empty()) return {};
  AlignedTable table(5);
  table.Add({"name", "old", "new", "difference", seconds ? "per second" : ""});
  for (const Change &change : changes) table.Add(change.Cells(seconds));
  return table.Lines();
}

void PrintChanges(Json &json, const std::vector<Change> &changes, std::optional<double> seconds) {
  json.Member("seconds", seconds);
  json.Objects("changes", changes, [&](const Change &change) {
    json.Key("name");
    json.PlainText(NameOf(change));
    PrintEntry(json, "old", change.old);
    PrintEntry(json, "new", change.now);
    if (const std::optional<uint64_t> magnitude = MagnitudeOf(change)) {
      PrintNumber(json, "difference", *magnitude, DifferenceOf(change));
    }
    if (const std::optional<double> rate = RateOf(change, seconds)) json.Member("rate", rate);
    if (!RemarkOf(change).empty()) json.Member("remark", RemarkOf(change));
  });
}

}  // namespace tools
