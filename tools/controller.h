// Connects to controllers and reads their buffers, with complaints.
#ifndef TOOLS_CONTROLLER_H
#define TOOLS_CONTROLLER_H

#include <optional>
#include <string>

#include "fleet/controllers.h"

namespace tools {

using fleet::BufferKind;
using fleet::FindBufferKind;

// A connection to a controller's driver. The destructor closes it.
class Controller {
 public:
  // Connects to the controller of the class; without a class, to the first that is present. When
  // it cannot, it complains. Messages name the buffer or stream to be read.
  Controller(const std::string &className, const std::string &bufferName);
  ~Controller();
  Controller(const Controller &) = delete;
  Controller &operator=(const Controller &) = delete;

  bool connected() const { return connection_ != 0; }

  // The row of the controller; null when none was found.
  const NandExporter *row() const { return row_; }

  // The class of the controller. When none was found, the class that was asked for, maybe empty.
  std::string name() const { return row_ == nullptr ? className_ : row_->className; }

  bool Offers(const BufferKind &kind) const { return row_->*kind.selectors != nullptr; }

  // Reads a buffer. Returns nothing after a complaint.
  std::optional<std::string> Read(const BufferKind &kind);

 private:
  std::string className_;
  std::string bufferName_;
  const NandExporter *row_ = nullptr;
  uint32_t connection_ = 0;
};

}  // namespace tools

#endif
