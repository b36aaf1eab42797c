// A dump of statistics, walked once; its values become Python's own when they are asked for.
#ifndef PYTHON_DUMP_H
#define PYTHON_DUMP_H

#include <cstdint>
#include <string>
#include <vector>

#include "morwick/records.h"
#include "python/arguments.h"

namespace python {

// The keys of a stream as Python sees them. Made once, and never freed: objects of the interpreter
// must not be given back after its end.
class KeyNames {
 public:
  static const KeyNames &Of(MorwickStream stream);

  // Keys have places by their ids.
  uint32_t PlaceOf(const MorwickKey &key) const { return key.id - firstId_; }
  size_t placeCount() const { return names_.size(); }
  py::handle NameAt(uint32_t place) const { return names_[place]; }
  const MorwickKey &KeyAt(uint32_t place) const { return *keys_[place]; }

  // Null, without an exception, for what is no key's name.
  const MorwickKey *Find(py::handle name) const;

 private:
  explicit KeyNames(MorwickStream stream);

  uint32_t firstId_;
  std::vector<const MorwickKey *> keys_;
  std::vector<py::object> names_;
  py::dict places_;
};

class Dump {
 public:
  Dump(py::handle data, py::handle stream);

  // The last value of that name: a number, or of an array all numbers. Raises KeyError.
  py::object Value(py::handle name) const;
  bool Has(py::handle name) const { return Find(name) != nullptr; }
  size_t size() const { return order_.size(); }
  // All of them by name, in the order in which the names came first.
  py::dict Values() const;
  // Each value that the parser adds, with its name.
  py::list Entries() const;
  py::dict Summary() const;
  py::object Fault() const;
  uint64_t end() const { return end_; }
  py::bytes bytes() const { return bytes_; }

 private:
  struct Found {
    const uint8_t *values = nullptr;
    uint32_t count = 0;
  };

  void Walk();
  const Found *Find(py::handle name) const;
  uint64_t Load(const Found &found, uint32_t index) const;
  py::object ValueOf(const Found &found, const MorwickKey &key) const;

  py::bytes bytes_;
  MorwickStream stream_;
  const KeyNames &names_;
  std::vector<Found> found_;     // by place; the last record of each key
  std::vector<uint32_t> order_;  // places
  std::string fault_;
  uint64_t end_ = 0;
};

// id, name and number of values of each key.
py::list Keys(py::handle stream);

}  // namespace python

#endif
