// The parsers and the array add. The first byte chooses, the second one sets an array's shape.

#include <cstdlib>
#include <cstring>
#include <string>

#include "fuzz/fuzz.h"
#include "morwick/morwick.h"
#include "tests/entries.h"

namespace {

struct Outcome {
  uint64_t result = 0;
  size_t entries = 0;
  std::string text;
};

template <typename Context>
void Collect(const Context &context, Outcome *outcome) {
  const Entries entries(context);
  Require(entries.sound);
  outcome->entries = entries.count;
  outcome->text = entries.text;
}

Outcome Parse(uint8_t kind, uint8_t shape, const uint8_t *data, size_t size) {
  Outcome outcome;
  if (kind % 4 == 0) {
    KVRStatsCxt context = {};
    outcome.result =
        static_cast<uint64_t>(KVRParseBufferToCxt(&context, data, static_cast<uint32_t>(size)));
    Require(outcome.result <= 1 && context.parseMarker == -1);
    Require(outcome.result == 1 || size < 8 || context.exportVersion == 0);
    Collect(context, &outcome);
    KVRReleaseContext(&context);
    return outcome;
  }
  GenericParserCxt context = {};
  switch (kind % 4) {
    case 1:
      outcome.result = KVRFTLParseBufferToCxt(&context, data, static_cast<uint32_t>(size));
      break;
    case 2:
      outcome.result = KVRMSPParseBufferToCxt(&context, data, size);
      break;
    default: {
      const uint32_t width = shape % 8 + 1;
      const auto count = static_cast<uint32_t>(size / width);
      Require(AddMultipleFieldsToGenericContext(&context, "field", data, width, count) == 1);
      outcome.result = count;
    }
  }
  Collect(context, &outcome);
  Require(outcome.result == outcome.entries);  // memory is never refused here
  ReleaseGenericParserCxt(&context);
  return outcome;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size < 2 || size > 60000) return 0;
  const Outcome first = Parse(data[0], data[1], data + 2, size - 2);
  const Outcome second = Parse(data[0], data[1], data + 2, size - 2);
  Require(first.result == second.result && first.text == second.text);
  Require(std::strlen(GetAPIErrorMessage()) < 1024);
  return 0;
}
