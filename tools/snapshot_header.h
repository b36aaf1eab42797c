// Checks a snapshot header that comes from a file before the library is trusted with it.
#ifndef TOOLS_SNAPSHOT_HEADER_H
#define TOOLS_SNAPSHOT_HEADER_H

#include <string>
#include <string_view>

namespace tools {

// Empty when text, descriptor table and descriptors lie inside the file; otherwise which field is
// wrong, and its value.
std::string CheckSnapshotHeader(std::string_view file);

}  // namespace tools

#endif
