// What the fuzz targets share.
#ifndef FUZZ_FUZZ_H
#define FUZZ_FUZZ_H

#include <cstdint>
#include <cstdlib>

// An invariant; breaking it is a finding.
inline void Require(bool holds) {
  if (!holds) std::abort();
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size);

#endif
