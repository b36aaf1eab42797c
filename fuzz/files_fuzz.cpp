// Files from outside: the first byte chooses between a scenario, names of statistics, a list of
// files, and data that may be gzip's.

#include <unistd.h>

#include <cassert>
#include <cstdlib>
#include <set>
#include <sstream>
#include <vector>

#include "fleet/columns.h"
#include "fleet/file_list.h"
#include "fleet/gzip.h"
#include "morwick/morwick.h"
#include "platform/simulated/scenario.h"

namespace {

void CheckScenario(std::string_view text) {
  std::string error;
  const bool isGood = simulated::ParseScenario(text, "folder/file", &error).has_value();
  assert(isGood ? error.empty() : error.starts_with("folder/file:"));
}

// A selection has each column once, and has the names of all its columns. A NUL separates the names
// from a dump.
void CheckNames(MorwickStream stream, std::string_view text) {
  const size_t end = std::min(text.find('\0'), text.size());
  if (end > 40) return;  // the search for the closest name takes its time
  const std::string_view dump = text.substr(std::min(end + 1, text.size()));
  std::vector<std::string> names;
  std::istringstream list{std::string(text.substr(0, end))};
  for (std::string name; std::getline(list, name, ',');) names.push_back(name);
  try {
    const fleet::Selection selection({&stream, 1}, names);
    std::set<std::string> columns;
    for (const auto &[key, index, name] : selection.columns()) {
      assert(index < key->valueCount && selection.Has(name));
      assert(columns.insert(name).second);
    }
    std::vector<uint64_t> values(columns.size());
    std::vector<uint8_t> present(columns.size());
    const fleet::ColumnFiller filler(stream, selection);
    const fleet::Verdict verdict = filler.Fill(dump, values, present);
    assert(verdict.faults == fleet::JudgeDump(stream, dump).faults);
  } catch (const fleet::UnknownName &unknown) {
    assert(std::string_view(unknown.what()).starts_with("no statistic"));
  }
}

// Each name that is not empty comes once. This runs in an empty folder, where no name is a folder.
void CheckList(char end, std::string_view text) {
  if (text.empty() || text.find_first_of("/.-") != std::string_view::npos) return;
  if (end == '\n') text = text.substr(0, text.find('\0'));  // a list of lines ends at a NUL
  std::string copy(text);
  fleet::FileList list({}, fmemopen(copy.data(), copy.size(), "r"), end);
  fleet::ListedFile file;
  std::istringstream names(copy);
  for (std::string name; std::getline(names, name, end);) {
    const bool isRight = name.empty() || (list.Next(&file) && file.name == name);
    assert(isRight && file.fault.empty());
  }
  const bool isThere = list.Next(&file);
  assert(!isThere);
}

// Unpacks data that is read in pieces of `in` bytes, in pieces of `out` bytes.
std::string Unpack(std::string_view data, size_t in, size_t out) {
  size_t taken = 0;
  fleet::GzipReader reader([&](char *bytes, size_t room) -> fleet::ReadResult {
    const size_t count = data.copy(bytes, std::min(room, in), taken);
    taken += count;
    return {count, ""};
  });
  std::string whole;
  for (;;) {
    std::vector<char> room(out);
    const fleet::ReadResult result = reader.Read(room.data(), room.size());
    assert(result.count <= room.size() && (result.fault.empty() || result.count == 0));
    whole.append(room.data(), result.count);
    if (result.count == 0) return whole + "|" + result.fault;
    if (whole.size() > 1 << 20) return "too large";
  }
}

// The result does not depend on the sizes of the pieces.
void CheckGzip(std::string_view data) {
  const std::string whole = Unpack(data, data.size() + 1, 1 << 16);
  assert(Unpack(data, 1, 1 << 16) == whole && Unpack(data, 3, 7) == whole);
  if (!data.starts_with("\x1f\x8b")) assert(whole == std::string(data) + "|");
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
  char folder[] = "/tmp/files_fuzz.XXXXXX";
  return mkdtemp(folder) == nullptr || chdir(folder) != 0 || rmdir(folder) != 0 ? 1 : 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size == 0) return 0;
  const std::string_view rest(reinterpret_cast<const char *>(data) + 1, size - 1);
  switch (data[0] % 7) {
    case 0: CheckScenario(rest); break;
    case 4: CheckList('\n', rest); break;
    case 5: CheckList('\0', rest); break;
    case 6: CheckGzip(rest); break;
    default: CheckNames(static_cast<MorwickStream>(data[0] % 7 - 1), rest); break;
  }
  return 0;
}
