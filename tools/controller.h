// Finds controllers, connects to them and reads their buffers.
#ifndef TOOLS_CONTROLLER_H
#define TOOLS_CONTROLLER_H

#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "morwick/morwick.h"

namespace tools {

// A buffer that can be read from a controller: its name for people, and the slot of a row that
// gives the numbers of the request.
struct BufferKind {
  std::string_view name;
  SelectorGetter NandExporter::*selectors;
};

// All kinds, in the order in which messages list them.
std::span<const BufferKind> BufferKinds();

// The kind with that name, or the kind that holds the stream with that name: kvr and ftl share one
// buffer. Null for an unknown name.
const BufferKind *FindBufferKind(std::string_view name);

// A driver's result code, as messages show it.
std::string Hexadecimal(int32_t result);

// The rows of the table that have a class.
std::span<NandExporter> KnownControllers();

// The row of the class, or null.
NandExporter *FindRow(std::string_view className);

// Whether a controller of a class is present, and whether it lets us connect.
struct Presence {
  bool present = false;
  bool opened = false;  // the connection is closed again
  int32_t result = 0;   // the driver's, of opening
};
Presence Probe(const NandExporter &row);

// A connection to a controller's driver. The destructor closes it.
class Controller {
 public:
  // Connects to the controller of the class; without a class, to the first that is present.
  // Complaints name `what`, the buffer or stream to be read. When `connected` is false it has
  // complained.
  Controller(const std::string &className, const std::string &what);
  ~Controller();
  Controller(const Controller &) = delete;
  Controller &operator=(const Controller &) = delete;

  bool connected() const { return connection_ != 0; }

  // The row of the controller; null when none was found.
  const NandExporter *row() const { return row_; }

  // The class of the controller. When none was found: the class that was asked for, maybe empty.
  std::string name() const { return row_ == nullptr ? className_ : row_->className; }

  bool Offers(const BufferKind &kind) const { return row_->*kind.selectors != nullptr; }

  // Reads a buffer. Returns nothing after a complaint.
  std::optional<std::string> Read(const BufferKind &kind);

 private:
  std::string className_;
  std::string what_;
  const NandExporter *row_ = nullptr;
  uint32_t connection_ = 0;
};

}  // namespace tools

#endif
