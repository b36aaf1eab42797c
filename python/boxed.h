// C++ objects in capsules, which Python owns. pybind11's own classes would end the process when
// memory is refused while an object is made.
#ifndef PYTHON_BOXED_H
#define PYTHON_BOXED_H

#include <memory>
#include <typeinfo>

#include "python/arguments.h"

namespace python {

template <typename Object, typename... Arguments>
py::object MakeBoxed(Arguments... arguments) {
  auto object = std::make_unique<Object>(arguments...);
  PyObject *box = PyCapsule_New(object.get(), typeid(Object).name(), [](PyObject *self) {
    delete static_cast<Object *>(PyCapsule_GetPointer(self, typeid(Object).name()));
  });
  if (box == nullptr) throw py::error_already_set();
  static_cast<void>(object.release());
  return py::reinterpret_steal<py::object>(box);
}

template <typename Object>
Object &Unbox(py::handle box) {
  void *object = PyCapsule_GetPointer(box.ptr(), typeid(Object).name());
  if (object == nullptr) throw py::error_already_set();
  return *static_cast<Object *>(object);
}

}  // namespace python

#endif
