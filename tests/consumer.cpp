// A tool in C++: the number helpers and an empty snapshot.

#include <cstdio>
#include <vector>

#include "morwick/morwick.h"

int main() {
  std::vector<char> text(2000);
  uint64_t size = text.size();
  if (KVRParseSnapshotBuffer(nullptr, 0, text.data(), &size) != 1) return 1;
  std::printf("%u GB, %llu characters\n", GetUserCapacityInGB(30000),
              static_cast<unsigned long long>(size));
}
