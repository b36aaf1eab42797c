// Finds controllers, connects to them and reads their buffers.
#ifndef TOOLS_CONTROLLER_H
#define TOOLS_CONTROLLER_H

#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "morwick/morwick.h"

namespace tools {

// What can be read from a controller: the name that people use, and the request's numbers by row.
struct BufferKind {
  std::string_view name;
  SelectorGetter NandExporter::*selectors;
};

// All kinds, in the order in which they are listed.
std::span<const BufferKind> BufferKinds();

// The kind of that name, or of that stream of statistics: kvr and ftl are read from the same
// buffer. Null for an unknown name.
const BufferKind *FindBufferKind(std::string_view name);

// A driver's result code, as messages show it.
std::string Hexadecimal(int32_t result);

// The rows of the table that have a class.
std::span<NandExporter> KnownControllers();

// The row of the class, or null.
NandExporter *FindRow(std::string_view className);

// What there is of a driver class at the moment.
struct Presence {
  bool present = false;
  bool opened = false;  // it was closed again at once
  int32_t result = 0;   // of opening
};
Presence Probe(const NandExporter &row);

// A connection to a controller's driver, closed in every case.
class Controller {
 public:
  // Connects to the controller of the class, or, without one, to the first that is present. `what`
  // is what it is wanted for, in complaints. Check `connected` then: if not, it has complained.
  Controller(const std::string &className, const std::string &what);
  ~Controller();
  Controller(const Controller &) = delete;
  Controller &operator=(const Controller &) = delete;

  bool connected() const { return connection_ != 0; }

  // The row of the controller; null when none was found.
  const NandExporter *row() const { return row_; }

  // The class; the one that was asked for, if any, while none was found.
  std::string name() const { return row_ == nullptr ? className_ : row_->className; }

  bool Offers(const BufferKind &kind) const { return row_->*kind.selectors != nullptr; }

  // Reads a buffer. Without a value it has complained.
  std::optional<std::string> Read(const BufferKind &kind);

 private:
  std::string className_;
  std::string what_;
  const NandExporter *row_ = nullptr;
  uint32_t connection_ = 0;
};

}  // namespace tools

#endif
