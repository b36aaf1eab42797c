// What changed between two readings of the same statistics.

#include "tools/changes.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <new>
#include <unordered_map>

#include "tools/text.h"

namespace tools {
namespace {

// Of one name: its entries in the old reading, and how many of them have been met again.
struct Occurrences {
  std::vector<const ContextNode *> values;
  size_t met = 0;
};

// Columns of text, right-aligned but for the first and the last.
using Row = std::array<std::string, 6>;

void PrintRows(Output &output, const std::vector<Row> &rows) {
  std::array<size_t, std::tuple_size_v<Row>> widths = {};
  for (const Row &row : rows) {
    for (size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], row[i].size());
  }
  for (const Row &row : rows) {
    std::string line = row.front();
    line.resize(widths.front(), ' ');
    for (size_t i = 1; i + 1 < row.size(); ++i) {
      if (widths[i] == 0) continue;  // nothing to say in this column
      line += "  " + std::string(widths[i] - row[i].size(), ' ') + row[i];
    }
    if (!row.back().empty()) line += "  " + row.back();
    output.Write(line + "\n");
  }
}

void PrintNumber(Json &json, const char *key, uint64_t magnitude, std::string_view digits) {
  json.Numbers(key, false, [&](auto print) { print(magnitude, digits); });
}

std::vector<Change> Compare(const Statistics &old, const Statistics &now, bool all) {
  std::unordered_map<std::string_view, Occurrences> before;
  const ContextNode *value = old.values();
  for (const ContextNode *name = old.names(); name != nullptr; name = name->next) {
    before[name->text].values.push_back(value);
    value = value->next;
  }
  std::vector<Change> changes;
  value = now.values();
  for (const ContextNode *name = now.names(); name != nullptr; name = name->next) {
    const ContextNode *same = nullptr;
    const auto found = before.find(name->text);
    if (found != before.end() && found->second.met < found->second.values.size()) {
      same = found->second.values[found->second.met++];
    }
    if (all || same == nullptr || same->value != value->value) {
      changes.push_back({name->text, same, value});
    }
    value = value->next;
  }
  std::unordered_map<std::string_view, size_t> passed;
  value = old.values();
  for (const ContextNode *name = old.names(); name != nullptr; name = name->next) {
    if (passed[name->text]++ >= before[name->text].met) {
      changes.push_back({name->text, value, nullptr});
    }
    value = value->next;
  }
  return changes;
}

}  // namespace

std::string_view Change::Remark() const {
  if (old == nullptr) return "appeared";
  if (now == nullptr) return "vanished";
  return now->value < old->value ? "backwards" : "";
}

std::string Change::Difference() const {
  if (old == nullptr || now == nullptr) return "";
  if (now->value < old->value) return "-" + std::to_string(old->value - now->value);
  return std::to_string(now->value - old->value);
}

std::optional<double> Change::Rate(double seconds) const {
  if (old == nullptr || now == nullptr) return std::nullopt;
  const bool backwards = now->value < old->value;
  const auto difference =
      static_cast<double>(backwards ? old->value - now->value : now->value - old->value);
  const double rate = (backwards ? -difference : difference) / seconds;
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

void PrintChanges(Output &output, const std::vector<Change> &changes,
                  std::optional<double> seconds) {
  if (changes.empty()) return;
  std::vector<Row> rows = {{"name", "old", "new", "difference", seconds ? "per second" : "", ""}};
  for (const Change &change : changes) {
    const std::optional<double> rate = seconds ? change.Rate(*seconds) : std::nullopt;
    rows.push_back({std::string(change.name), change.old == nullptr ? "" : change.old->text,
                    change.now == nullptr ? "" : change.now->text, change.Difference(),
                    rate ? ThreeDecimals(*rate) : "", std::string(change.Remark())});
  }
  PrintRows(output, rows);
}

void PrintChanges(Json &json, const std::vector<Change> &changes, std::optional<double> seconds) {
  json.Key("seconds");
  seconds ? json.Fraction(*seconds) : json.Null();
  json.Key("changes");
  json.BeginArray();
  for (const Change &change : changes) {
    json.BeginObject();
    json.Key("name");
    json.PlainText(change.name);
    if (change.old != nullptr) PrintNumber(json, "old", change.old->value, change.old->text);
    if (change.now != nullptr) PrintNumber(json, "new", change.now->value, change.now->text);
    if (const std::string difference = change.Difference(); !difference.empty()) {
      const uint64_t old = change.old->value;
      const uint64_t now = change.now->value;
      PrintNumber(json, "difference", now < old ? old - now : now - old, difference);
    }
    if (const std::optional<double> rate = seconds ? change.Rate(*seconds) : std::nullopt) {
      json.Key("rate");
      json.Fraction(*rate);
    }
    if (!change.Remark().empty()) json.Member("remark", change.Remark());
    json.EndObject();
  }
  json.EndArray();
}

}  // namespace tools
