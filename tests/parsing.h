// Calls each parser in the same way and reads what it leaves, for tests and fuzz targets.
#ifndef TESTS_PARSING_H
#define TESTS_PARSING_H

#include <cstdlib>
#include <cstring>
#include <string>

#include "morwick/morwick.h"

// The first three are those of MorwickStream.
enum Kind { kKVR, kFTL, kMSP, kArray };

struct Contexts {
  KVRStatsCxt kvr;
  GenericParserCxt generic;
};

// Parses into the context of the kind, or into none when `contexts` is null. For an array the first
// byte is the width of its elements.
inline uint64_t ParseInto(Contexts *contexts, Kind kind, const char *data, size_t size) {
  KVRStatsCxt *kvr = contexts == nullptr ? nullptr : &contexts->kvr;
  GenericParserCxt *generic = contexts == nullptr ? nullptr : &contexts->generic;
  const auto size32 = static_cast<uint32_t>(size);
  switch (kind) {
    case kKVR: return static_cast<uint64_t>(KVRParseBufferToCxt(kvr, data, size32));
    case kFTL: return KVRFTLParseBufferToCxt(generic, data, size32);
    case kMSP: return KVRMSPParseBufferToCxt(generic, data, size);
    case kArray: break;
  }
  const auto width = static_cast<unsigned char>(data[0]);
  const uint32_t count = width == 0 ? 1 : (size32 - 1) / width;
  return AddMultipleFieldsToGenericContext(generic, "f", data + 1, width, count) == 1 ? 1 : 0;
}

// A context's entries as text, with what must hold for any context checked.
struct Entries {
  std::string text;  // "name=value " for each entry
  size_t count = 0;
  // The lists have the same length, the tails are the last nodes, and the texts are the values.
  bool sound = true;

  template <typename Context>
  explicit Entries(const Context &context) {
    const ContextNode *name = context.namesHead, *lastName = nullptr;
    const ContextNode *value = context.valuesHead, *lastValue = nullptr;
    for (; name != nullptr && value != nullptr; name = name->next, value = value->next, ++count) {
      sound = sound && value->text == std::to_string(value->value) && name->value == 0;
      text.append(name->text).append("=").append(value->text).append(" ");
      lastName = name;
      lastValue = value;
    }
    sound = sound && name == nullptr && value == nullptr && context.namesTail == lastName &&
            context.valuesTail == lastValue;
  }
};

// The walk over the same records, and its entries as text.
inline std::string WalkedEntries(Kind kind, const void *data, size_t size, MorwickRecord *end) {
  std::string text;
  MorwickRecordReader reader;
  MorwickStartRecords(&reader, static_cast<MorwickStream>(kind), data, size);
  while (MorwickNextRecord(&reader, end) != 0) {
    for (uint32_t i = 0; i < end->valueCount; ++i) {
      char name[kMorwickNameRoom];
      std::memset(name, 'x', sizeof name);
      const uint32_t length = MorwickValueName(reader.stream, end->key, end->valueCount, i, name);
      text.append(std::strlen(name) == length ? name : "a name of another length").append("=");
      text.append(std::to_string(MorwickValue(end, i))).append(" ");
    }
  }
  return text;
}

inline Entries EntriesOf(const Contexts &contexts, Kind kind) {
  return kind == kKVR ? Entries(contexts.kvr) : Entries(contexts.generic);
}

// Returns the error message and clears it.
inline std::string TakeMessage() {
  std::string message = GetAPIErrorMessage();
  std::free(GlobalAPIErrorMessage);
  GlobalAPIErrorMessage = nullptr;
  return message;
}

#endif
