// Checks the parsers, the adding of arrays, and the walk over records, whose entries must be those
// of the parser. The first byte chooses.

#include <cassert>
#include <cstring>

#include "tests/parsing.h"

namespace {

// Parses, and returns the entries and the result as text.
std::string Parse(Kind kind, const char *data, size_t size) {
  Contexts contexts = {};
  const uint64_t result = ParseInto(&contexts, kind, data, size);
  const Entries entries = EntriesOf(contexts, kind);
  assert(entries.sound);
  assert(kind == kKVR || kind == kArray ? result <= 1 : result == entries.count);
  KVRReleaseContext(&contexts.kvr);
  ReleaseGenericParserCxt(&contexts.generic);
  return entries.text + std::to_string(result);
}

// The walk takes the values that the parser takes, and ends where the parser ends: at a record that
// ends the walk a KVR parse fails, and the others find no more entries.
void CheckWalk(Kind kind, std::string_view dump) {
  MorwickRecord end;
  const std::string walked = WalkedEntries(kind, dump.data(), dump.size(), &end);
  const std::string whole = Parse(kind, dump.data(), dump.size());
  assert(whole.substr(0, walked.size()) == walked);
  assert(whole.find('=', walked.size()) == std::string::npos);
  assert(end.offset <= dump.size() && end.following <= dump.size() - end.offset);
  if (kind == kKVR) {
    assert(dump.size() < 8 || whole.ends_with('1') == (end.step == kMorwickEndOfBuffer ||
                                                       end.step == kMorwickPartOfHeader));
  } else {
    assert(whole == Parse(kind, dump.data(), end.offset));
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size < 2 || size > 60000) return 0;
  const auto kind = static_cast<Kind>(data[0] % 4);
  const auto *bytes = reinterpret_cast<const char *>(data) + 1;
  assert(Parse(kind, bytes, size - 1) == Parse(kind, bytes, size - 1));
  if (kind != kArray) CheckWalk(kind, {bytes, size - 1});
  assert(std::strlen(GetAPIErrorMessage()) < 1024);
  return 0;
}
