// Reads buffers from a controller, with complaints.

#include "tools/controller.h"

#include <cerrno>
#include <new>

#include "tools/memory.h"
#include "tools/messages.h"

namespace tools {

// From finding a service to storing the connection no statement may throw: the handle would leak.
Controller::Controller(const std::string &className, const std::string &bufferName)
    : className_(className), bufferName_(bufferName) {
  NandExporter *row = fleet::FindRow(className);
  errno = 0;
  const uint32_t service = row == nullptr ? findNandExporter(&row) : MorwickFindService(row);
  if (service != 0) {
    row_ = row;
    const int32_t result = fleet::Open(service, &connection_);
    if (connection_ != 0) return;
    Complain(name() + ": " + bufferName,
             "the connection was refused, result " + fleet::Hexadecimal(result));
  } else if (errno == ENOMEM) {
    ThrowOutOfMemory();
  } else if (className.empty()) {
    Complain(bufferName, "no controller is present");
  } else {
    Complain(className + ": " + bufferName, "the controller is not present");
  }
}

Controller::~Controller() {
  if (connection_ == 0) return;
  const int32_t result = CloseService(connection_);
  if (result == 0) return;
  try {
    Note(name() + ": " + bufferName_,
         "closing the connection failed, result " + fleet::Hexadecimal(result));
  } catch (const std::bad_alloc &) {  // main complains of it
  }
}

std::optional<std::string> Controller::Read(const BufferKind &kind) {
  fleet::Reply reply = fleet::ReadBuffer(connection_, *row_, kind);
  if (!reply.bytes) Complain(name() + ": " + std::string(kind.name), reply.fault);
  return std::move(reply.bytes);
}

}  // namespace tools
