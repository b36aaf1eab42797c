// A dump of statistics.

#include "python/dump.h"

#include <pybind11/numpy.h>

#include <array>
#include <cerrno>
#include <memory>
#include <new>
#include <optional>

#include "fleet/judge.h"
#include "fleet/summary.h"
#include "morwick/kvr_stats.h"
#include "morwick/little_endian.h"

namespace python {
namespace {

// Below this size two threads that ask for all values take longer with the lock given back than
// without: they wait for it more than the walk takes.
constexpr size_t kWorthUnlocking = 128 << 10;

py::int_ Number(uint64_t value) {
  auto number = py::reinterpret_steal<py::int_>(PyLong_FromUnsignedLongLong(value));
  if (!number) throw py::error_already_set();
  return number;
}

}  // namespace

KeyNames::KeyNames(MorwickStream stream) : firstId_(MorwickKeyAt(stream, 0)->id) {
  const uint32_t count = MorwickKeyCount(stream);
  const uint32_t places = MorwickKeyAt(stream, count - 1)->id - firstId_ + 1;
  keys_.resize(places);
  names_.resize(places);
  for (uint32_t i = 0; i < count; ++i) {
    const MorwickKey &key = *MorwickKeyAt(stream, i);
    const uint32_t place = PlaceOf(key);
    keys_[place] = &key;
    names_[place] = py::str(key.name);
    places_[names_[place]] = place;
  }
}

const KeyNames &KeyNames::Of(MorwickStream stream) {
  static const KeyNames *const stats = new KeyNames(kMorwickKVR);
  static const KeyNames *const msp = new KeyNames(kMorwickMSP);
  return stream == kMorwickMSP ? *msp : *stats;
}

const MorwickKey *KeyNames::Find(py::handle name) const {
  PyObject *place = PyDict_GetItemWithError(places_.ptr(), name.ptr());
  if (place != nullptr) return keys_[PyLong_AsUnsignedLong(place)];
  if (PyErr_Occurred() != nullptr) throw py::error_already_set();
  return nullptr;
}

Dump::Dump(py::handle data, py::handle stream)
    : bytes_(AsBytes(data, "data", UINT32_MAX)),
      stream_(AsStream(stream)),
      names_(KeyNames::Of(stream_)),
      found_(names_.placeCount()) {
  std::optional<py::gil_scoped_release> release;
  if (ViewOf(bytes_).size() >= kWorthUnlocking) release.emplace();
  Walk();
}

void Dump::Walk() {
  const std::string_view dump = ViewOf(bytes_);
  fleet::Judge judge(dump);
  MorwickRecordReader reader;
  MorwickRecord record;
  order_.reserve(names_.placeCount());
  MorwickStartRecords(&reader, stream_, dump.data(), dump.size());
  while (MorwickNextRecord(&reader, &record) != 0) {
    judge.Take(record);
    if (record.valueCount == 0) continue;
    const uint32_t place = names_.PlaceOf(*record.key);
    if (found_[place].count == 0) order_.push_back(place);
    found_[place] = {static_cast<const uint8_t *>(record.values), record.valueCount};
  }
  fault_ = judge.Finish(record).Fault();
  end_ = record.offset;
}

const Dump::Found *Dump::Find(py::handle name) const {
  const MorwickKey *key = names_.Find(name);
  if (key == nullptr) return nullptr;
  const Found &found = found_[names_.PlaceOf(*key)];
  return found.count == 0 ? nullptr : &found;
}

uint64_t Dump::Load(const Found &found, uint32_t index) const {
  return stream_ == kMorwickMSP ? LoadLittleEndian32(found.values + size_t{4} * index)
                                : LoadLittleEndian64(found.values + size_t{8} * index);
}

py::object Dump::ValueOf(const Found &found, const MorwickKey &key) const {
  if (key.valueCount == 1) return Number(Load(found, 0));
  py::array_t<uint64_t> array(found.count);
  uint64_t *values = array.mutable_data();
  for (uint32_t i = 0; i < found.count; ++i) values[i] = Load(found, i);
  return array;
}

py::object Dump::Value(py::handle name) const {
  const Found *found = Find(name);
  if (found != nullptr) return ValueOf(*found, *names_.Find(name));
  PyErr_SetObject(PyExc_KeyError, name.ptr());
  throw py::error_already_set();
}

py::dict Dump::Values() const {
  py::dict values;
  for (const uint32_t place : order_) {
    const py::object value = ValueOf(found_[place], names_.KeyAt(place));
    if (PyDict_SetItem(values.ptr(), names_.NameAt(place).ptr(), value.ptr()) != 0) {
      throw py::error_already_set();
    }
  }
  return values;
}

py::list Dump::Entries() const {
  const std::string_view dump = ViewOf(bytes_);
  py::list entries;
  MorwickRecordReader reader;
  MorwickRecord record;
  std::array<char, kMorwickNameRoom> name;
  MorwickStartRecords(&reader, stream_, dump.data(), dump.size());
  while (MorwickNextRecord(&reader, &record) != 0) {
    for (uint32_t i = 0; i < record.valueCount; ++i) {
      const uint32_t length =
          MorwickValueName(stream_, record.key, record.valueCount, i, name.data());
      entries.append(
          py::make_tuple(AsText({name.data(), length}), Number(MorwickValue(&record, i))));
    }
  }
  return entries;
}

py::dict Dump::Summary() const {
  py::dict summary;
  if (stream_ != kMorwickKVR) return summary;
  const std::string_view dump = ViewOf(bytes_);
  KVRStatsCxt fields = {};
  const std::unique_ptr<KVRStatsCxt, decltype(&KVRReleaseContext)> owned(&fields,
                                                                         KVRReleaseContext);
  errno = 0;
  KVRParseBufferToCxt(&fields, dump.data(), static_cast<uint32_t>(dump.size()));
  if (errno == ENOMEM) throw std::bad_alloc();
  const auto isPresent = [&](std::string_view name) { return Has(AsText(name)); };
  for (const fleet::Figure &figure : fleet::Summarise(fields, isPresent)) {
    const py::str name = AsText(figure.name);
    if (figure.ratio) {
      summary[name] = *figure.ratio;
    } else if (figure.values.size() == 1) {
      summary[name] = Number(figure.values[0]);
    } else {
      summary[name] = py::array_t<uint64_t>(static_cast<py::ssize_t>(figure.values.size()),
                                            figure.values.data());
    }
  }
  return summary;
}

py::object Dump::Fault() const {
  if (fault_.empty()) return py::none();
  return AsText(fault_);
}

py::list Keys(py::handle stream) {
  const MorwickStream known = AsStream(stream);
  py::list keys;
  for (uint32_t i = 0; i < MorwickKeyCount(known); ++i) {
    const MorwickKey &key = *MorwickKeyAt(known, i);
    keys.append(py::make_tuple(key.id, key.name, key.valueCount));
  }
  return keys;
}

}  // namespace python
