// The JSON that every sub-command prints with -o json: one object, written as it goes and complete
// also when the command fails. docs/morwick.schema.json describes it.
#ifndef TOOLS_JSON_H
#define TOOLS_JSON_H

#include <rapidjson/writer.h>

#include <concepts>
#include <cstdint>
#include <string>
#include <string_view>

#include "tools/io.h"
#include "tools/memory.h"

namespace tools {

// Where the data comes from, or came from.
struct Source {
  std::string_view kind;  // file, controller
  std::string name;       // of a controller empty while none was found
};

// Numbers above it lose their last digits in readers that take all numbers for doubles; a text twin
// stands beside them.
constexpr uint64_t kLargestExact = uint64_t{1} << 53;

// What is made of memory once the object has begun is little beside the reserve that is held for
// it: a command reads and compares before.
class Json {
 public:
  // Begins the object: what made it, and where the data comes from. Throws std::bad_alloc, and
  // writes nothing, where there is no memory to end it.
  Json(Output &output, std::string_view command, const std::vector<Source> &sources = {});

  void Key(std::string_view key) { writer_.Key(key.data(), Length(key)); }
  // Bytes that are not UTF-8 are replaced.
  void Text(std::string_view text);
  // Known to be UTF-8, such as what a parser names.
  void PlainText(std::string_view text) { writer_.String(text.data(), Length(text)); }
  void Number(std::unsigned_integral auto number) { writer_.Uint64(number); }
  void Fraction(double number) { writer_.Double(number); }
  // Digits, with a sign or without.
  void Digits(std::string_view digits) {
    writer_.RawValue(digits.data(), digits.size(), rapidjson::kNumberType);
  }
  void Null() { writer_.Null(); }
  void BeginObject() { writer_.StartObject(); }
  void EndObject() { writer_.EndObject(); }
  void BeginArray() { writer_.StartArray(); }
  void EndArray() { writer_.EndArray(); }

  void Member(std::string_view key, std::string_view text) {
    Key(key);
    Text(text);
  }
  void Member(std::string_view key, std::unsigned_integral auto number) {
    Key(key);
    Number(number);
  }

  // Numbers by that key, in an array or as the one that there is; once more as texts where one of
  // them is too large for a double. `each` hands each value and its digits to what it is given.
  template <typename Each>
  void Numbers(std::string_view key, bool array, Each each) {
    const auto print = [&](auto printOne) {
      if (array) BeginArray();
      each(printOne);
      if (array) EndArray();
    };
    bool exact = true;
    Key(key);
    print([&](uint64_t value, std::string_view digits) {
      Digits(digits);
      exact = exact && value <= kLargestExact;
    });
    if (exact) return;
    Key(std::string(key) + "_s");
    print([&](uint64_t, std::string_view digits) { PlainText(digits); });
  }

  // Ends the object with the messages so far, which are forgotten then, and the status, which it
  // returns: it is bad where memory was refused.
  Status Finish(Status status);

 private:
  // What the writer puts its characters into.
  struct Stream {
    using Ch = char;
    void Put(char c) { output.Put(c); }
    void Flush() {}
    Output &output;
  };
  using Memory = rapidjson::MemoryPoolAllocator<>;

  static rapidjson::SizeType Length(std::string_view text) {
    return static_cast<rapidjson::SizeType>(text.size());
  }

  void PrintMessage(std::string_view severity, std::string_view text);

  MemoryReserve reserve_{2 << 20};
  Stream stream_;
  char room_[4096] = {};  // for the writer's stack, which so takes no memory from the heap
  Memory memory_{room_, sizeof room_};
  rapidjson::Writer<Stream, rapidjson::UTF8<>, rapidjson::UTF8<>, Memory> writer_{stream_,
                                                                                  &memory_};
};

}  // namespace tools

#endif
