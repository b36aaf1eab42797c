// Controllers: which there are, and a connection to one of them.
#ifndef PYTHON_CONTROLLER_H
#define PYTHON_CONTROLLER_H

#include <mutex>
#include <string>

#include "fleet/controllers.h"
#include "python/arguments.h"

namespace python {

// A connection to a controller. Several threads may use it: one at a time has it.
class Connection {
 public:
  // Opens it to the class, or with None to the first controller that is present.
  explicit Connection(py::handle className);
  ~Connection() { CloseHandle(); }
  Connection(const Connection &) = delete;
  Connection &operator=(const Connection &) = delete;

  std::string name() const { return row_->className; }
  bool Offers(py::handle kind) const;
  py::bytes Read(py::handle kind);
  // Raises what the driver says; the handle is closed in any case, and only once.
  void Close();

 private:
  int32_t CloseHandle();

  const NandExporter *row_ = nullptr;
  std::mutex mutex_;
  uint32_t connection_ = 0;
};

// Class, present, opened, result of opening and what it offers, of each class that is known.
py::list Controllers();

}  // namespace python

#endif
