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

inline Stream StatsStream(int copies) {
  std::mt19937_64 random(1);
  Stream stream;
  for (int copy = 0; copy < copies; ++copy) {
    for (uint32_t id = 0; id < 660; ++id) {
      const morwick::StatsKey *key = morwick::FindStatsKey(id);
      if (key == nullptr) continue;
      Append(&stream.buffer, key->id);
      Append(&stream.buffer, key->elements);
      for (uint32_t i = 0; i < key->elements; ++i) {
        Append(&stream.buffer, MixedMagnitude(random, 64));
      }
      stream.entries += key->elements;
    }
  }
  return stream;
}

inline Stream MSPStream(int copies) {
  std::mt19937_64 random(1);
  Stream stream;
  for (int copy = 0; copy < copies; ++copy) {
    for (uint32_t id = 4096; id < 8215; ++id) {
      const morwick::StatsKey *key = morwick::FindMSPKey(id);
      if (key == nullptr) continue;
      Append(&stream.buffer, static_cast<uint16_t>(key->id));
      Append(&stream.buffer, static_cast<uint16_t>(key->elements * 4));
      for (uint32_t i = 0; i < key->elements; ++i) {
        Append(&stream.buffer, static_cast<uint32_t>(MixedMagnitude(random, 32)));
      }
      stream.entries += key->elements;
    }
  }
  return stream;
}

}  // namespace bench

#endif
