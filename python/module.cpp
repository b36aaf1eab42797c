// What the package `morwick` is made of.

#include <pybind11/stl.h>

#include <exception>
#include <stdexcept>
#include <utility>

#include "fleet/streams.h"
#include "morwick/morwick.h"
#include "python/boxed.h"
#include "python/controller.h"
#include "python/dump.h"
#include "python/snapshot.h"
#include "python/table.h"

namespace {

// pybind11 has words of its own where an object of Python's is missing; that memory was refused
// says more.
void KeepMemoryError(std::exception_ptr error) {
  try {
    std::rethrow_exception(std::move(error));
  } catch (const std::runtime_error &) {
    if (PyErr_Occurred() == nullptr || PyErr_ExceptionMatches(PyExc_MemoryError) == 0) throw;
  }
}

}  // namespace

PYBIND11_MODULE(_native, module) {
  using namespace python;
  py::register_local_exception_translator(KeepMemoryError);
  // Now, before there are threads that could wait for each other's lock.
  for (const MorwickStream stream : fleet::kStreams) KeyNames::Of(stream);
  PrepareLayouts();
  module.attr("version") = MORWICK_VERSION_TEXT;
  module.attr("platform") = MORWICK_PLATFORM_NAME;

  module.def("parse", &MakeBoxed<Dump, py::handle, py::handle>);
  module.def("value",
             [](py::handle dump, py::handle name) { return Unbox<Dump>(dump).Value(name); });
  module.def("has", [](py::handle dump, py::handle name) { return Unbox<Dump>(dump).Has(name); });
  module.def("values", [](py::handle dump) { return Unbox<Dump>(dump).Values(); });
  module.def("entries", [](py::handle dump) { return Unbox<Dump>(dump).Entries(); });
  module.def("summary", [](py::handle dump) { return Unbox<Dump>(dump).Summary(); });
  module.def("size", [](py::handle dump) { return Unbox<Dump>(dump).size(); });
  module.def("fault", [](py::handle dump) { return Unbox<Dump>(dump).Fault(); });
  module.def("end", [](py::handle dump) { return Unbox<Dump>(dump).end(); });
  module.def("data", [](py::handle dump) { return Unbox<Dump>(dump).bytes(); });

  module.def("connect", &MakeBoxed<Connection, py::handle>);
  module.def("name", [](py::handle box) { return AsText(Unbox<Connection>(box).name()); });
  module.def("offers",
             [](py::handle box, py::handle kind) { return Unbox<Connection>(box).Offers(kind); });
  module.def("read",
             [](py::handle box, py::handle kind) { return Unbox<Connection>(box).Read(kind); });
  module.def("close", [](py::handle box) { Unbox<Connection>(box).Close(); });
  module.def("controllers", &Controllers);
  module.def("keys", &Keys);
  module.def("snapshot", &Snapshot);
  module.def("render", &Render);
  module.def("table", &Table);
}
