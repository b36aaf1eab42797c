// What the package `morwick` is made of.

#include <pybind11/stl.h>

#include "fleet/streams.h"
#include "morwick/morwick.h"
#include "python/controller.h"
#include "python/dump.h"
#include "python/snapshot.h"
#include "python/table.h"

PYBIND11_MODULE(_native, module) {
  using namespace python;
  // Now, before there are threads that could wait for each other's lock.
  for (const MorwickStream stream : fleet::kStreams) KeyNames::Of(stream);
  RegisterRecords();
  module.attr("version") = MORWICK_VERSION_TEXT;
  module.attr("platform") = MORWICK_PLATFORM_NAME;

  py::class_<Dump>(module, "Dump")
      .def(py::init<py::handle, py::handle>())
      .def("value", &Dump::Value)
      .def("has", &Dump::Has)
      .def("values", &Dump::Values)
      .def("entries", &Dump::Entries)
      .def("summary", &Dump::Summary)
      .def_property_readonly("size", &Dump::size)
      .def_property_readonly("fault", &Dump::Fault)
      .def_property_readonly("end", &Dump::end)
      .def_property_readonly("data", &Dump::bytes);
  py::class_<Connection>(module, "Connection")
      .def(py::init<py::handle>())
      .def_property_readonly("name", &Connection::name)
      .def("offers", &Connection::Offers)
      .def("read", &Connection::Read)
      .def("close", &Connection::Close);
  module.def("controllers", &Controllers);
  module.def("keys", &Keys);
  module.def("snapshot", &Snapshot);
  module.def("render", &Render);
  module.def("table", &Table);
}
