// Reads a snapshot header, and checks it before the library gets it.
#ifndef FLEET_SNAPSHOT_HEADER_H
#define FLEET_SNAPSHOT_HEADER_H

#include <string>
#include <string_view>

#include "morwick/snapshot.h"

namespace fleet {

// In bytes. Larger ones are refused.
constexpr size_t kLargestHeader = 1 << 20;

// Says what is wrong; empty when the header is whole, its records are not too large, and its first
// field, which tells empty records, lies inside them.
std::string CheckSnapshotHeader(std::string_view file);

// Says that a whole header has too many fields; empty when it has not. Null stands for the fixed
// layout.
std::string CheckFieldCount(const char *header);

// The numbers at the beginning of a file, which must be at least as large as a SnapshotHeader.
SnapshotHeader LoadSnapshotHeader(std::string_view file);

}  // namespace fleet

#endif
