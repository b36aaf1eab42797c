// Dumps, their parsed statistics, and the entries in these.
#ifndef TOOLS_STATISTICS_H
#define TOOLS_STATISTICS_H

#include <iterator>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "fleet/columns.h"
#include "fleet/streams.h"
#include "fleet/summary.h"
#include "morwick/morwick.h"
#include "tools/controller.h"
#include "tools/json.h"
#include "tools/output.h"

namespace tools {

// A dump, and the row whose parsers read it.
struct Dump {
  Source source;
  std::string subject;  // its name in complaints
  const NandExporter *row = nullptr;
  std::optional<std::string> bytes;  // nothing when not one byte could be read
  Status status = kGood;             // not good after a complaint: some bytes are missing
};

// Reads the dump of a stream from a file. It is taken as the dump of a controller of that class;
// without a class, of the first class that the library knows.
Dump ReadDumpFile(const std::string &file, MorwickStream stream, const std::string &className);

// Reads it from the controller of the class; without a class, from the first that is present.
Dump ReadDumpLive(MorwickStream stream, const std::string &className);

// Reads it through an open connection.
Dump ReadDump(Controller &controller, MorwickStream stream);

// An entry: a name and its value, from the two lists of a parser context.
struct Entry {
  const ContextNode *nameNode;
  const ContextNode *valueNode;

  std::string_view name() const { return nameNode->text; }
  uint64_t value() const { return valueNode->value; }
  std::string_view digits() const { return valueNode->text; }
};

// Goes through the entries in their order. With a filter it passes over those that do not match.
class EntryIterator {
 public:
  EntryIterator(Entry entry, const fleet::Selection *filter) : entry_(entry), filter_(filter) {
    PassOver();
  }

  const Entry &operator*() const { return entry_; }
  const Entry *operator->() const { return &entry_; }
  EntryIterator &operator++() {
    entry_ = {entry_.nameNode->next, entry_.valueNode->next};
    PassOver();
    return *this;
  }
  bool operator==(std::default_sentinel_t) const { return entry_.nameNode == nullptr; }

 private:
  void PassOver() {
    while (filter_ != nullptr && entry_.nameNode != nullptr && !filter_->Has(entry_.name())) {
      entry_ = {entry_.nameNode->next, entry_.valueNode->next};
    }
  }

  Entry entry_;
  const fleet::Selection *filter_;
};

// The entries of a dump, as the parser in its row makes them.
class Statistics {
 public:
  Statistics(const Dump &dump, MorwickStream stream,
             std::shared_ptr<const fleet::Selection> filter);
  ~Statistics();
  Statistics(const Statistics &) = delete;
  Statistics &operator=(const Statistics &) = delete;

  // The parser's own result.
  uint64_t result() const { return result_; }

  EntryIterator begin() const {
    return {{context_.generic.namesHead, context_.generic.valuesHead}, filter_.get()};
  }
  static std::default_sentinel_t end() { return std::default_sentinel; }

  // The last value of that name, also when the filter does not match it.
  std::optional<uint64_t> Find(std::string_view name) const;

  // The summary fields. Only the KVR stream has them.
  const KVRStatsCxt &summary() const { return context_.kvr; }

  // Whether entries are missing because memory was refused.
  bool outOfMemory() const { return outOfMemory_; }

  // Complains of what is wrong with the dump, and tells where its statistics end when bytes follow.
  Status Check(const Dump &dump) const;

 private:
  // The first of all entries, also of those that the filter does not match.
  EntryIterator First() const {
    return {{context_.generic.namesHead, context_.generic.valuesHead}, nullptr};
  }

  const NandExporter *row_;
  MorwickStream stream_;
  std::shared_ptr<const fleet::Selection> filter_;
  uint64_t result_ = 0;
  bool outOfMemory_ = false;
  // Both begin with the same four fields, so the lists can be read from either.
  union {
    KVRStatsCxt kvr;
    GenericParserCxt generic;
  } context_ = {};
};

// One entry, or the elements of an array: entries that follow each other and are numbered from 0.
struct EntryGroup {
  EntryIterator first;
  size_t count;
  std::string_view base;  // the name, without the number of an array's element

  bool IsArray() const { return count > 1; }

  // Calls `take` with each entry and its index.
  template <typename Take>
  void ForEach(Take take) const {
    EntryIterator entry = first;
    for (size_t i = 0; i < count; ++i, ++entry) take(*entry, i);
  }
};

// Returns the next group of entries and moves `*next` past it; nothing after the last group.
std::optional<EntryGroup> TakeGroup(EntryIterator *next);

// The summary fields that the dump has, in the order of KVRStatsCxt, then the write amplification.
std::vector<fleet::Figure> SummaryOf(const Statistics &statistics);

}  // namespace tools

#endif
