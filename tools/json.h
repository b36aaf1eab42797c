// The JSON that each sub-command prints with -o json: one object. It is written piece by piece, and
// is complete even when the command fails. docs/morwick.schema.json describes it.
#ifndef TOOLS_JSON_H
#define TOOLS_JSON_H

#include <rapidjson/writer.h>

#include <concepts>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "tools/memory.h"
#include "tools/output.h"

namespace tools {

// Where data comes from.
struct Source {
  std::string_view kind;  // "file" or "controller"
  std::string name;       // empty when no controller was found
};

// Many readers store numbers as doubles, in which every number up to this one is exact. A larger
// one has a text with the same digits beside it.
constexpr uint64_t kLargestExact = uint64_t{1} << 53;

// Begin the object only after reading and comparing: from then on the command may need no more
// memory than the reserve that the object holds.
class Json {
 public:
  // Begins the object with version, platform, command and sources. When there is no memory for the
  // reserve it writes nothing and throws std::bad_alloc.
  Json(Output &output, std::string_view command, const std::vector<Source> &sources = {});

  void Key(std::string_view key) { writer_.Key(key.data(), Length(key)); }
  // Bytes that are not UTF-8 are replaced.
  void Text(std::string_view text);
  // For text that is certainly UTF-8, such as the name of a statistic.
  void PlainText(std::string_view text) { writer_.String(text.data(), Length(text)); }
  void Number(std::unsigned_integral auto number) { writer_.Uint64(number); }
  // A number whose decimal digits are known.
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
  void Member(std::string_view key, std::optional<double> number) {
    Key(key);
    number ? writer_.Double(*number) : writer_.Null();
  }

  // A member with an object, whose members `print` prints.
  template <typename Print>
  void Object(std::string_view key, Print print) {
    Key(key);
    BeginObject();
    print();
    EndObject();
  }

  // A member with an array; `print` prints each element.
  template <typename Elements, typename Print>
  void Array(std::string_view key, const Elements &elements, Print print) {
    Key(key);
    BeginArray();
    for (const auto &element : elements) print(element);
    EndArray();
  }

  // A member with an array of objects, one for each element; `print` prints an object's members.
  template <typename Elements, typename Print>
  void Objects(std::string_view key, const Elements &elements, Print print) {
    Array(key, elements, [&](const auto &element) {
      BeginObject();
      print(element);
      EndObject();
    });
  }

  // A member with one number or an array of them. When one is above kLargestExact, a second member
  // (KEY_s) has them as texts. `each` gets a function and calls it with each value and its digits.
  template <typename Each>
  void Numbers(std::string_view key, bool isArray, Each each) {
    const auto print = [&](auto printOne) {
      if (isArray) BeginArray();
      each(printOne);
      if (isArray) EndArray();
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

  // Ends the object with the messages so far and the status. Forgets the messages. Returns the
  // status; when memory was refused it is kBadData.
  Status Finish(Status status);

 private:
  // The writer's output.
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

  MemoryReserve reserve_{2 << 20};  // bytes
  Stream stream_;
  char room_[4096] = {};  // for the writer's stack, instead of memory from the heap
  Memory memory_{room_, sizeof room_};
  rapidjson::Writer<Stream, rapidjson::UTF8<>, rapidjson::UTF8<>, Memory> writer_{stream_,
                                                                                  &memory_};
};

}  // namespace tools

#endif
