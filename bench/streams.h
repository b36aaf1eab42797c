// Statistics buffers to measure on: every known key once, values of all magnitudes.
#ifndef BENCH_STREAMS_H
#define BENCH_STREAMS_H

#include <bit>
#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "morwick/records.h"

namespace bench {

// A value of up to `bits` bits. Each length is equally likely, as counters may be small or large.
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

// Every key of a stream, `copies` times. A header is two of `HeaderPart`: the key, and the number
// of its values times `lengthUnit`. Values have up to `bits` bits.
template <typename HeaderPart, typename Value>
Stream MakeStream(MorwickStream kind, uint32_t lengthUnit, int copies, std::mt19937_64 &random,
                  int bits = 8 * sizeof(Value)) {
  Stream stream;
  for (int copy = 0; copy < copies; ++copy) {
    for (uint32_t index = 0; index < MorwickKeyCount(kind); ++index) {
      const MorwickKey &key = *MorwickKeyAt(kind, index);
      Append(&stream.buffer, static_cast<HeaderPart>(key.id));
      Append(&stream.buffer, static_cast<HeaderPart>(key.valueCount * lengthUnit));
      for (uint32_t i = 0; i < key.valueCount; ++i) {
        Append(&stream.buffer, static_cast<Value>(MixedMagnitude(random, bits)));
      }
      stream.entries += key.valueCount;
    }
  }
  return stream;
}

inline Stream StatsStream(int copies) {
  std::mt19937_64 random(1);
  return MakeStream<uint32_t, uint64_t>(kMorwickKVR, 1, copies, random);
}

inline Stream MSPStream(int copies) {
  std::mt19937_64 random(1);
  return MakeStream<uint16_t, uint32_t>(kMorwickMSP, sizeof(uint32_t), copies, random);
}

}  // namespace bench

#endif
