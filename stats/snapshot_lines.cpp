// Lines of the fixed snapshot layout, several numbers at a time on x86-64, each in the same time
// whatever its length. Each store has 16 or 64 bytes, so the line needs room after its end.

#include "stats/snapshot_lines.h"

#include <algorithm>
#include <atomic>
#include <string_view>

#ifdef __x86_64__
#pragma GCC diagnostic ignored "-Wuninitialized"  // GCC 12 warns of its own header
#include <immintrin.h>

#define AVX2 [[gnu::target("avx2")]]
#define AVX512 [[gnu::target("avx512bw,avx512ifma,avx512vbmi2")]]
#endif

namespace morwick {
namespace {

#ifdef __x86_64__

constexpr size_t kSlotSize = 16;                       // bytes of the smallest vector
constexpr size_t kSlots = (kColumnCount + 7) / 8 * 8;  // one for each column, then empty ones
static_assert(kLabelRoom + kNumberRoom <= kSlotSize);

// The columns as the kernels need them. A slot has the label at its left end and the number, with
// leading zeros, at its right end; `first` is the index of the first digit that is no leading zero.
struct Slots {
  alignas(64) uint8_t digitIndices[kSlotSize][2 * kSlotSize] = {};  // by `first`; 0x80 is no digit
  alignas(64) char text[kSlots][kSlotSize] = {};                    // the label, then padding
  uint64_t always[kSlots / 4] = {};        // a bit for each byte: whether every number prints it
  uint8_t length[kSlots][kSlotSize] = {};  // of label and padded number, by `first`

  consteval Slots() {
    for (size_t first = 0; first < kSlotSize; ++first) {
      for (size_t i = 0; i < 2 * kSlotSize; ++i) {
        digitIndices[first][i] = static_cast<uint8_t>(i >= first && i < kSlotSize ? i : 0x80);
      }
    }
    for (size_t i = 0; i < kColumnCount; ++i) {
      const std::string_view label = kColumns[i].label;
      const size_t width = kColumns[i].width;
      std::ranges::fill(text[i], kColumns[i].pad);
      label.copy(text[i], label.size());
      const uint64_t labelAndWidth = 0x10000 - (0x10000U >> width) + (1U << label.size()) - 1;
      always[i / 4] |= labelAndWidth << i % 4 * kSlotSize;
      for (size_t first = 0; first < kSlotSize; ++first) {
        length[i][first] = static_cast<uint8_t>(label.size() + std::max(width, kSlotSize - first));
      }
    }
  }
};
constexpr Slots kColumnSlots;

// The number of each column, in print order; 0 for the empty slots.
struct alignas(64) Values {
  uint32_t at[kSlots] = {};

  explicit Values(const uint8_t *record) {
#pragma GCC unroll 64
    for (size_t i = 0; i < kColumnCount; ++i) at[i] = ColumnValue(kColumns[i], record);
  }
};

// A number is split into fours of digits, then twos, then digits. Each split halves the lanes:
// number + quotient * (2^(half a lane's bits) - divisor) has the remainder in the lower half and
// the quotient in the upper. The quotient is number * factor >> shift, with the factor 2^shift /
// divisor rounded up. Until the bytes are reversed, the last digit comes first.
constexpr __m128i kReversed = {0x08090a0b0c0d0e0f, 0x0001020304050607};

AVX2 inline __m256i Times(__m256i numbers, int64_t factor, int shift = 0) {
  return _mm256_srli_epi64(_mm256_mul_epu32(numbers, _mm256_set1_epi64x(factor)), shift);
}

// Writes the label and the number of a slot. `nonZero` has a bit for each digit that is not 0.
AVX2 inline char *PutSlot(char *out, __m128i digits, uint32_t nonZero, size_t slot) {
  const auto first = static_cast<size_t>(__builtin_ctz(nonZero | 0x8000));  // 0x8000: the last one
  const size_t length = kColumnSlots.length[slot][first];
  const uint8_t *indices = kColumnSlots.digitIndices[first] + kSlotSize - length;
  digits = _mm_shuffle_epi8(digits, _mm_loadu_si128(reinterpret_cast<const __m128i *>(indices)));
  digits |= *reinterpret_cast<const __m128i *>(kColumnSlots.text[slot]);
  _mm_storeu_si128(reinterpret_cast<__m128i *>(out), digits);
  return out + length;
}

// Writes two slots from twos of digits.
AVX2 inline char *PutTwo(char *out, __m256i twos, size_t slot) {
  const __m256i tens = _mm256_mulhi_epu16(twos, _mm256_set1_epi16(6554));  // / 10
  __m256i digits = twos + _mm256_mullo_epi16(tens, _mm256_set1_epi16((1 << 8) - 10));
  digits = _mm256_shuffle_epi8(digits, _mm256_broadcastsi128_si256(kReversed));
  const __m256i zeros = _mm256_cmpeq_epi8(digits, _mm256_setzero_si256());
  const auto nonZero = ~static_cast<uint32_t>(_mm256_movemask_epi8(zeros));
  digits |= _mm256_set1_epi8('0' - ' ');  // the text adds ' ' or '0': a digit in both cases
  out = PutSlot(out, _mm256_castsi256_si128(digits), nonZero, slot);
  return PutSlot(out, _mm256_extracti128_si256(digits, 1), nonZero >> 16, slot + 1);
}

AVX2 char *WriteAvx2(char *out, const uint8_t *record) {
  const Values values(record);
  for (size_t slot = 0; slot < kColumnCount; slot += 4) {
    // Ordered so that unpacklo below gives the first two numbers and unpackhi the other two.
    const __m128i *four = reinterpret_cast<const __m128i *>(values.at + slot);
    const __m256i numbers = _mm256_cvtepu32_epi64(_mm_shuffle_epi32(*four, 0b11'01'10'00));
    const __m256i top = Times(numbers, 1441151881, 57);  // / 10^8: digits nine and ten
    const __m256i rest = numbers - Times(top, 100000000);
    const __m256i fours = rest + Times(Times(rest, 3518437209, 45), (int64_t{1} << 32) - 10000);
    const __m256i hundreds =
        _mm256_srli_epi32(_mm256_madd_epi16(fours, _mm256_set1_epi32(10486)), 20);
    const __m256i twos = fours + _mm256_mullo_epi32(hundreds, _mm256_set1_epi32((1 << 16) - 100));
    out = PutTwo(out, _mm256_unpacklo_epi64(twos, top), slot);
    out = PutTwo(out, _mm256_unpackhi_epi64(twos, top), slot + 2);
  }
  *out++ = '\n';
  return out;
}

// Writes four slots from twos of digits.
AVX512 inline char *PutFour(char *out, __m512i twos, size_t slot) {
  const __m512i tens = _mm512_mulhi_epu16(twos, _mm512_set1_epi16(6554));
  __m512i digits = twos + _mm512_mullo_epi16(tens, _mm512_set1_epi16((1 << 8) - 10));
  digits = _mm512_shuffle_epi8(digits, _mm512_broadcast_i32x4(kReversed));
  const uint64_t nonZero = _mm512_test_epi8_mask(digits, digits) | 0x8000'8000'8000'8000;
  // In each slot, the bit of the first digit that is no leading zero, and all bits above it.
  const uint64_t digitsFrom = ~((nonZero - 0x0001'0001'0001'0001) & ~nonZero);
  const uint64_t printed = kColumnSlots.always[slot / 4] | digitsFrom;
  const __m512i text =
      _mm512_mask_add_epi8(*reinterpret_cast<const __m512i *>(kColumnSlots.text[slot]), digitsFrom,
                           digits, _mm512_set1_epi8('0'));
  _mm512_storeu_si512(out, _mm512_maskz_compress_epi8(printed, text));
  return out + __builtin_popcountll(printed);
}

AVX512 char *WriteAvx512(char *out, const uint8_t *record) {
  const Values values(record);
  const __m512i zero = _mm512_setzero_si512();
  const __m512i tenThousandth = _mm512_set1_epi64((int64_t{1} << 52) / 10000 + 1);
  // Each number in 64 bits; unpacklo below gives the first four and unpackhi the other four.
  const __m512i order = _mm512_setr_epi32(0, 0, 4, 4, 1, 1, 5, 5, 2, 2, 6, 6, 3, 3, 7, 7);
  for (size_t slot = 0; slot < kSlots; slot += 8) {
    const __m256i *eight = reinterpret_cast<const __m256i *>(values.at + slot);
    const __m512i numbers =
        _mm512_maskz_permutexvar_epi32(0x5555, order, _mm512_castsi256_si512(*eight));
    const __m512i quotient = _mm512_madd52hi_epu64(zero, numbers, tenThousandth);
    const __m512i top = _mm512_madd52hi_epu64(zero, quotient, tenThousandth);
    const __m512i fours =
        _mm512_madd52lo_epu64(numbers, quotient, _mm512_set1_epi64((int64_t{1} << 32) - 10000)) -
        _mm512_madd52lo_epu64(zero, top, _mm512_set1_epi64(int64_t{10000} << 32));
    const __m512i hundreds =
        _mm512_srli_epi32(_mm512_madd_epi16(fours, _mm512_set1_epi32(10486)), 20);
    const __m512i twos = fours + _mm512_mullo_epi32(hundreds, _mm512_set1_epi32((1 << 16) - 100));
    out = PutFour(out, _mm512_unpacklo_epi64(twos, top), slot);
    out = PutFour(out, _mm512_unpackhi_epi64(twos, top), slot + 4);
  }
  out -= kSlots - kColumnCount;  // an empty slot prints one digit
  *out++ = '\n';
  return out;
}

#endif

constexpr LineKernel kKernels[] = {
#ifdef __x86_64__
    {"AVX-512 VBMI2",
     [] {
       return __builtin_cpu_supports("avx512bw") && __builtin_cpu_supports("avx512ifma") &&
              __builtin_cpu_supports("avx512vbmi2");
     },
     WriteAvx512},
    {"AVX2", []() -> bool { return __builtin_cpu_supports("avx2"); }, WriteAvx2},
#endif
    {"scalar", [] { return true; }, WriteLine},
};

}  // namespace

std::span<const LineKernel> LineKernels() { return kKernels; }

// Needs no lock: threads that choose at the same time choose the same.
LineWriter *FastestLineWriter() {
  static std::atomic<LineWriter *> chosen;
  if (chosen == nullptr) {
    chosen = std::ranges::find_if(kKernels, [](const auto &one) { return one.runs(); })->write;
  }
  return chosen;
}

}  // namespace morwick
