// Reads a snapshot header, and checks it before the library is trusted with it.
#ifndef FLEET_SNAPSHOT_HEADER_H
#define FLEET_SNAPSHOT_HEADER_H

#include <string>
#include <string_view>

#include "morwick/snapshot.h"

namespace fleet {

// In bytes. Larger ones are refused.
constexpr size_t kLargestHeader = 1 << 20;

// Empty for a header that is whole, with records of a bearable size that can be told from empty
// ones; otherwise what is wrong.
std::string CheckSnapshotHeader(std::string_view file);

// Empty for a header, which is whole, of a bearable number of fields; otherwise what is wrong. Null
// stands for the fixed layout.
std::string CheckFieldCount(const char *header);

// The numbers that a file of at least the header's size begins with.
SnapshotHeader LoadSnapshotHeader(std::string_view file);

}  // namespace fleet

#endif
