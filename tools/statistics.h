// Statistics: where a dump comes from, what a parser makes of it, and its entries.
#ifndef TOOLS_STATISTICS_H
#define TOOLS_STATISTICS_H

#include <iterator>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "morwick/morwick.h"
#include "tools/controller.h"
#include "tools/io.h"
#include "tools/json.h"
#include "tools/options.h"

namespace tools {

// A dump, and the row whose parsers are for it.
struct Dump {
  Source source;
  std::string subject;  // what it is called in complaints
  const NandExporter *row = nullptr;
  std::optional<std::string> bytes;  // none when nothing could be read
  Status status = kGood;             // if not good it has complained, and bytes are missing
};

// Reads the dump of a stream from a file, as one that was read from a controller of the class, or
// of the first one known.
Dump ReadDumpFile(const std::string &file, MorwickStream stream, const std::string &className);

// Reads it from the controller of the class, or the first that is present.
Dump ReadDumpLive(MorwickStream stream, const std::string &className);

// Reads it through a connection that is there.
Dump ReadDump(Controller &controller, MorwickStream stream);

// An entry of the two lists.
struct Entry {
  const ContextNode *nameNode;
  const ContextNode *valueNode;

  std::string_view name() const { return nameNode->text; }
  uint64_t value() const { return valueNode->value; }
  std::string_view digits() const { return valueNode->text; }
};

// Goes through the entries in their order; through those that the filter has, if there is one.
class EntryIterator {
 public:
  using value_type = Entry;
  using difference_type = std::ptrdiff_t;

  EntryIterator() = default;
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
  EntryIterator operator++(int) {
    const EntryIterator before = *this;
    ++*this;
    return before;
  }
  bool operator==(const EntryIterator &other) const {
    return entry_.nameNode == other.entry_.nameNode;
  }
  bool operator==(std::default_sentinel_t) const { return entry_.nameNode == nullptr; }

 private:
  void PassOver() {
    while (filter_ != nullptr && entry_.nameNode != nullptr && !filter_->Has(entry_.name())) {
      entry_ = {entry_.nameNode->next, entry_.valueNode->next};
    }
  }

  Entry entry_ = {};
  const fleet::Selection *filter_ = nullptr;
};

// The lists of a dump, parsed through its row's slots.
class Statistics {
 public:
  Statistics(const Dump &dump, MorwickStream stream, Filter filter = nullptr);
  ~Statistics();
  Statistics(const Statistics &) = delete;
  Statistics &operator=(const Statistics &) = delete;

  // As the parser returned it.
  uint64_t result() const { return result_; }

  EntryIterator begin() const {
    return {{context_.generic.namesHead, context_.generic.valuesHead}, filter_.get()};
  }
  static std::default_sentinel_t end() { return std::default_sentinel; }

  // The last value of that name, whether the filter has it or not.
  std::optional<uint64_t> Find(std::string_view name) const;

  // The summary fields; of the KVR stream only.
  const KVRStatsCxt &summary() const { return context_.kvr; }

  // Whether entries are missing for want of memory.
  bool outOfMemory() const { return outOfMemory_; }

  // Says what is wrong with the dump, and where its statistics end, if not at its end.
  Status Check(const Dump &dump) const;

 private:
  const NandExporter *row_;
  MorwickStream stream_;
  Filter filter_;
  uint64_t result_ = 0;
  bool outOfMemory_ = false;
  // Both begin with the same four fields, so that the lists are read from either.
  union {
    KVRStatsCxt kvr;
    GenericParserCxt generic;
  } context_ = {};
};

// An entry, or consecutive ones that are the elements of one array: numbered from 0 without a gap.
struct EntryGroup {
  EntryIterator first;
  size_t count;
  std::string_view base;  // the name, of an array what stands before the number

  bool IsArray() const { return count > 1; }

  // Calls `take` with each entry and its index.
  template <typename Take>
  void ForEach(Take take) const {
    EntryIterator entry = first;
    for (size_t i = 0; i < count; ++i, ++entry) take(*entry, i);
  }
};

// Hands out the entries of statistics in their order, as groups.
class EntryGroups {
 public:
  explicit EntryGroups(const Statistics &statistics) : next_(statistics.begin()) {}

  // Nothing behind the last one.
  std::optional<EntryGroup> Take();

 private:
  EntryIterator next_;
};

// What the main figures are called, and their values, digits or a fraction.
struct Figure {
  std::string_view name;
  std::vector<uint64_t> values;
  std::string fraction = "";  // instead of values
};

// The summary fields that the dump had, in the order of KVRStatsCxt, and what follows from them.
std::vector<Figure> SummaryOf(const Statistics &statistics);

}  // namespace tools

#endif
