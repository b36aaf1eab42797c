// Reads a snapshot header, and checks it before the library is trusted with it.
#ifndef FLEET_SNAPSHOT_HEADER_H
#define FLEET_SNAPSHOT_HEADER_H

#include <string>
#include <string_view>

#include "morwick/snapshot.h"

namespace fleet {

// Empty for a header that is whole, with records of a bearable size; otherwise what is wrong.
std::string CheckSnapshotHeader(std::string_view file);

// The numbers that a file of at least the header's size begins with.
SnapshotHeader LoadSnapshotHeader(std::string_view file);

}  // namespace fleet

#endif
