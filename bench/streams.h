// Statistics buffers to measure on: every known key once, values of all magnitudes.
#ifndef BENCH_STREAMS_H
#define BENCH_STREAMS_H

#include <bit>
#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "stats/msp_keys.h"
#include "stats/stats_keys.h"

namespace bench {

// As often small as large, as counters are.
inline uint64_t MixedMagnitude(std::mt19937_64 &random, int bits) {
  return random() >> (64 - static_cast<int>(random() % static_cast<unsigned>(bits)) - 1);
}

template <typename Integer>
void Append(std::string *buffer, Integer value) {
  static_assert(std::endian::native == std::endian::little);
  buffer->append(reinterpret_cast<const char *>(&value), sizeof value);
}

struct Stream {
  std::string buffer;
  size_t entries = 0;
};

// Every key that `find` knows below `ids`, so many times over. A header is two of `HeaderPart`: the
// key, and the number of its elements times `lengthUnit`.
template <typename HeaderPart, typename Element>
Stream MakeStream(const morwick::KeyRow *(*find)(uint32_t), uint32_t ids, uint32_t lengthUnit,
                  int copies) {
  std::mt19937_64 random(1);
  Stream stream;
  for (int copy = 0; copy < copies; ++copy) {
    for (uint32_t id = 0; id < ids; ++id) {
      const morwick::KeyRow *row = find(id);
      if (row == nullptr) continue;
      Append(&stream.buffer, static_cast<HeaderPart>(row->id));
      Append(&stream.buffer, static_cast<HeaderPart>(row->elementCount * lengthUnit));
      for (uint32_t i = 0; i < row->elementCount; ++i) {
        Append(&stream.buffer, static_cast<Element>(MixedMagnitude(random, 8 * sizeof(Element))));
      }
      stream.entries += row->elementCount;
    }
  }
  return stream;
}

constexpr uint32_t kIds = 0x10000;  // more than either table has

inline Stream StatsStream(int copies) {
  return MakeStream<uint32_t, uint64_t>(morwick::FindStatsKey, kIds, 1, copies);
}

inline Stream MSPStream(int copies) {
  return MakeStream<uint16_t, uint32_t>(morwick::FindMSPKey, kIds, sizeof(uint32_t), copies);
}

}  // namespace bench

#endif
