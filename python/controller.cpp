// Controllers and connections to them.

#include <cerrno>
#include <mutex>
#include <new>
#include <optional>
#include <span>
#include <utility>

#include "fleet/controllers.h"
#include "python/bindings.h"
#include "python/boxed.h"

namespace python {
namespace {

// Raises the package's ControllerError, with the driver's result if there is one.
[[noreturn]] void Fail(const std::string &message, std::optional<int32_t> result) {
  const py::object type = py::module_::import("morwick").attr("ControllerError");
  py::object code = py::none();
  if (result) code = py::int_(static_cast<uint32_t>(*result));
  PyErr_SetObject(type.ptr(), type(message, code).ptr());
  throw py::error_already_set();
}

py::list Offered(const NandExporter &row) {
  py::list offered;
  for (const fleet::BufferKind &kind : fleet::BufferKinds()) {
    if (row.*kind.selectors != nullptr) offered.append(AsText(kind.name));
  }
  return offered;
}

const fleet::BufferKind &KindOf(py::handle kindName) {
  const std::string name = AsString(kindName, "what");
  const fleet::BufferKind *kind = fleet::FindBufferKind(name);
  if (kind != nullptr) return *kind;
  std::string known = "kvr, ftl";
  for (const fleet::BufferKind &each : fleet::BufferKinds()) {
    known += ", " + std::string(each.name);
  }
  throw py::value_error("what must be one of " + known + ", not '" + name + "'");
}

// A connection to a controller. Several threads may share it: a lock lets one call run at a time.
class Connection {
 public:
  // Connects to the class, or for None to the first controller that is present. Nothing may throw
  // between finding a service and storing the connection: the handle would leak.
  explicit Connection(py::handle className) {
    std::string absent = "no controller is present";
    std::span<NandExporter> rows = fleet::KnownControllers();
    if (!className.is_none()) {
      const std::string name = AsString(className, "name");
      NandExporter *row = fleet::FindRow(name);
      if (row == nullptr) {
        throw py::value_error("name: there is no controller class '" + name + "'");
      }
      rows = {row, 1};
      absent = name + ": the controller is not present";
    }
    int32_t result = 0;
    {
      const py::gil_scoped_release release;
      for (auto row = rows.begin(); row != rows.end() && row_ == nullptr; ++row) {
        errno = 0;
        if (const uint32_t service = MorwickFindService(&*row); service != 0) {
          row_ = &*row;
          result = fleet::Open(service, &connection_);
        }
        if (connection_ == 0 && errno == ENOMEM) throw std::bad_alloc();
      }
    }
    if (row_ == nullptr) Fail(absent, {});
    if (connection_ == 0) {
      Fail(std::string(row_->className) + ": the connection was refused, result " +
               fleet::Hexadecimal(result),
           result);
    }
  }

  ~Connection() { CloseHandle(); }
  Connection(const Connection &) = delete;
  Connection &operator=(const Connection &) = delete;

  std::string name() const { return row_->className; }
  bool Offers(py::handle kind) const { return row_->*KindOf(kind).selectors != nullptr; }

  py::bytes Read(py::handle kind) {
    const fleet::BufferKind &known = KindOf(kind);
    std::optional<fleet::Reply> reply;
    {
      const py::gil_scoped_release release;
      const std::lock_guard lock(mutex_);
      if (connection_ != 0) reply = fleet::ReadBuffer(connection_, *row_, known);
    }
    if (!reply) throw py::value_error("the controller is closed");
    if (reply->bytes) return *reply->bytes;
    Fail(name() + ": " + std::string(known.name) + ": " + reply->fault, reply->result);
  }

  // Closes the handle once, whatever the driver says. Raises an error when the driver refuses.
  void Close() {
    int32_t result = 0;
    {
      const py::gil_scoped_release release;
      result = CloseHandle();
    }
    if (result == 0) return;
    Fail(name() + ": closing the connection failed, result " + fleet::Hexadecimal(result), result);
  }

 private:
  int32_t CloseHandle() {
    const std::lock_guard lock(mutex_);
    const uint32_t connection = std::exchange(connection_, 0);
    return connection == 0 ? 0 : CloseService(connection);
  }

  const NandExporter *row_ = nullptr;
  std::mutex mutex_;
  uint32_t connection_ = 0;
};

// For each known class its name, Presence, and the buffers that it offers.
py::list Controllers() {
  py::list all;
  for (const NandExporter &row : fleet::KnownControllers()) {
    fleet::Presence presence;
    {
      const py::gil_scoped_release release;
      presence = fleet::Probe(row);
    }
    all.append(py::make_tuple(row.className, presence.present, presence.opened,
                              static_cast<uint32_t>(presence.result), py::tuple(Offered(row))));
  }
  return all;
}

}  // namespace

void BindControllers(py::module_ &module) {
  module.def("connect", &MakeBoxed<Connection, py::handle>);
  module.def("name", [](py::handle box) { return AsText(Unbox<Connection>(box).name()); });
  module.def("offers",
             [](py::handle box, py::handle kind) { return Unbox<Connection>(box).Offers(kind); });
  module.def("read",
             [](py::handle box, py::handle kind) { return Unbox<Connection>(box).Read(kind); });
  module.def("close", [](py::handle box) { Unbox<Connection>(box).Close(); });
  module.def("controllers", &Controllers);
}

}  // namespace python
