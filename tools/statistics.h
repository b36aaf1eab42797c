// Statistics: where a dump comes from, what a parser makes of it, and its entries.
#ifndef TOOLS_STATISTICS_H
#define TOOLS_STATISTICS_H

#include <string>
#include <string_view>
#include <vector>

#include "morwick/morwick.h"
#include "tools/controller.h"
#include "tools/io.h"
#include "tools/json.h"

namespace tools {

// Dumps above this are refused.
constexpr uint64_t kLargestDump = 16 << 20;

// A dump, and the row whose parsers are for it.
struct Dump {
  Source source;
  std::string subject;  // what it is called in complaints
  const NandExporter *row = nullptr;
  std::string bytes;
  Status status = kGood;  // if not good it has complained, and there are no bytes
};

// Reads the dump of a stream (kvr, ftl or msp) from a file, as one that was read from a controller
// of the class, or of the first one known.
Dump ReadDumpFile(const std::string &file, std::string_view stream, const std::string &className);

// Reads it from the controller of the class, or the first that is present.
Dump ReadDumpLive(std::string_view stream, const std::string &className);

// Reads it through a connection that is there.
Dump ReadDump(Controller &controller, std::string_view stream);

// The lists of a dump, parsed through its row's slots.
class Statistics {
 public:
  Statistics(const Dump &dump, std::string_view stream);
  ~Statistics();
  Statistics(const Statistics &) = delete;
  Statistics &operator=(const Statistics &) = delete;

  // As the parser returned it.
  uint64_t result() const { return result_; }

  const ContextNode *names() const { return context_.generic.namesHead; }
  const ContextNode *values() const { return context_.generic.valuesHead; }

  // The summary fields; kvr only.
  const KVRStatsCxt &summary() const { return context_.kvr; }

  // Whether entries are missing for want of memory.
  bool outOfMemory() const { return outOfMemory_; }

  // Says what is wrong with the dump, and where its statistics end, if not at its end.
  Status Judge(const Dump &dump) const;

 private:
  const NandExporter *row_;
  std::string_view stream_;
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
  const ContextNode *name;   // of the first
  const ContextNode *value;  // of the first
  size_t count;
  std::string_view base;  // the name, of an array what stands before the number

  bool IsArray() const { return count > 1; }
};

// Hands out the entries of two lists in their order, as groups. `TakeGroup` moves the lists on.
class EntryReader {
 public:
  explicit EntryReader(const Statistics &statistics)
      : name_(statistics.names()), value_(statistics.values()) {}

  bool AtEnd() const { return name_ == nullptr; }
  EntryGroup TakeGroup();

 private:
  const ContextNode *name_;
  const ContextNode *value_;
};

// The summary fields that the dump had, in the order of KVRStatsCxt.
struct SummaryField {
  std::string_view name;
  std::vector<uint64_t> values;
};
std::vector<SummaryField> SummaryOf(const Statistics &statistics);

}  // namespace tools

#endif
