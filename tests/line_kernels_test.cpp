// Each kernel for snapshot lines against the plain code.

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "stats/decimal.h"
#include "stats/snapshot_lines.h"

namespace {

using Words = std::array<uint32_t, 63>;

std::string_view Line(morwick::LineWriter *write, char *room, const uint8_t *record) {
  return {room, write(room, record)};
}

// Record and line at the two ends of a page without neighbours.
class LineKernelTest : public testing::TestWithParam<size_t> {
 protected:
  void SetUp() override {
    if (!kernel_.runs()) GTEST_SKIP() << "this processor has no " << kernel_.name;
    void *pages = mmap(nullptr, 3 * kPage, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    page_ = static_cast<uint8_t *>(pages) + kPage;
    ASSERT_EQ(mprotect(page_, kPage, PROT_READ | PROT_WRITE), 0);
  }

  // The record now at one end, now at the other.
  void Check(const Words &words) {
    recordFirst_ = !recordFirst_;
    uint8_t *record = recordFirst_ ? page_ : page_ + kPage - sizeof words;
    uint8_t *room = recordFirst_ ? page_ + kPage - morwick::kLineRoom : page_;
    std::memset(room, 'x', morwick::kLineRoom);
    std::memcpy(record, words.data(), sizeof words);
    char expected[morwick::kLineRoom];
    ASSERT_EQ(Line(kernel_.write, reinterpret_cast<char *>(room), record),
              Line(morwick::WriteLine, expected, record));
  }

  // Of all lengths.
  uint32_t RandomWord() {
    const uint64_t random = random_();
    return static_cast<uint32_t>(random >> 32 >> random % 32);
  }

  static constexpr size_t kPage = 4096;
  const morwick::LineKernel kernel_ = morwick::LineKernels()[GetParam()];
  uint8_t *page_ = nullptr;
  bool recordFirst_ = false;
  std::mt19937_64 random_{1};
};

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(LineKernelTest);  // other processors have none
INSTANTIATE_TEST_SUITE_P(Each, LineKernelTest,
                         testing::Range<size_t>(0, morwick::LineKernels().size() - 1));

TEST_P(LineKernelTest, WritesNumbersOfEachLengthInEachColumn) {
  Words words;
  std::ranges::generate(words, [&] { return RandomWord(); });
  for (uint32_t &word : words) {
    for (uint64_t power = 1; power <= 10000000000; power *= 10) {
      for (const uint64_t value : {power - 1, power, power + 1}) {
        word = static_cast<uint32_t>(std::min<uint64_t>(value, UINT32_MAX));
        Check(words);
      }
    }
    word = RandomWord();
  }
}

TEST_P(LineKernelTest, WritesRandomLines) {
#ifdef NDEBUG
  constexpr int kRounds = 10000000;
#else
  constexpr int kRounds = 20000;
#endif
  Words words;
  for (int round = 0; round < kRounds && !HasFailure(); ++round) {
    std::ranges::generate(words, [&] { return RandomWord(); });
    Check(words);
  }
}

// By scripts/every-value. The first column, whose number the plain code writes by itself.
TEST_P(LineKernelTest, DISABLED_WritesEveryValue) {
  const auto check = [this](uint64_t value, uint32_t step) {
    char line[morwick::kLineRoom];
    char expected[morwick::kLineRoom] = "T=";
    const std::string rest(Line(morwick::WriteLine, line, page_).substr(sizeof "T=0000" - 1));
    for (Words words = {}; value <= UINT32_MAX; value += step) {
      words[0] = static_cast<uint32_t>(value);
      char *end = morwick::WritePadded(expected + 2, words[0], 4, '0');
      end += rest.copy(end, rest.size());
      const auto *record = reinterpret_cast<const uint8_t *>(words.data());
      ASSERT_EQ(Line(kernel_.write, line, record), std::string_view(expected, end));
    }
  };
  std::vector<std::jthread> threads;
  const uint32_t count = std::max(std::thread::hardware_concurrency(), 1U);
  for (uint32_t first = 0; first < count; ++first) threads.emplace_back(check, first, count);
}

}  // namespace
