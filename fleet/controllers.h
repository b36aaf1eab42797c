// Which controllers the library knows and which are present, and how their buffers are read.
#ifndef FLEET_CONTROLLERS_H
#define FLEET_CONTROLLERS_H

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "morwick/morwick.h"

namespace fleet {

// A buffer that can be read from a controller: its name for people, and the member of NandExporter
// whose function gives the numbers of the request.
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

// The rows of nand_exporters, without the empty one at its end.
std::span<NandExporter> KnownControllers();

// The row of the class, or null.
NandExporter *FindRow(std::string_view className);

// Whether a controller of a class is present, and whether it lets us connect.
struct Presence {
  bool present = false;
  bool opened = false;  // the connection is closed again
  int32_t result = 0;   // the driver's code for opening
};
// Throws std::bad_alloc when the look-up is refused memory. A driver that is refused memory when it
// opens the connection says so by its result.
Presence Probe(const NandExporter &row);

// Connects, and releases the service, which an open connection does not need. Returns the driver's
// result; the connection is 0 when there is none.
int32_t Open(uint32_t service, uint32_t *connection);

// A buffer, or why it could not be read, with the driver's result code if the driver refused.
struct Reply {
  std::optional<std::string> bytes = {};
  std::string fault = {};
  std::optional<int32_t> result = {};
};

// Reads a buffer through a connection to the row's driver. Throws std::bad_alloc; a driver that is
// refused memory says so by its result.
Reply ReadBuffer(uint32_t connection, const NandExporter &row, const BufferKind &kind);

}  // namespace fleet

#endif
