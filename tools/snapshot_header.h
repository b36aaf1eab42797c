// Checks a snapshot header that comes from a file before the library is trusted with it.
#ifndef TOOLS_SNAPSHOT_HEADER_H
#define TOOLS_SNAPSHOT_HEADER_H

#include <string>
#include <string_view>

#include "morwick/snapshot.h"

namespace tools {

// Reads the fields at the start of the header; zeros where the file is too short.
SnapshotHeader ReadSnapshotHeader(std::string_view file);

// Empty when text, descriptor table and descriptors lie inside the file; otherwise which field is
// wrong, and its value.
std::string CheckSnapshotHeader(std::string_view file);

}  // namespace tools

#endif
