// Compares each kernel that writes snapshot lines with the plain code.

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <random>
#include <string_view>

#include "stats/snapshot_lines.h"

namespace {

using Words = std::array<uint32_t, 63>;

constexpr size_t kPage = 4096;
constexpr uint32_t kEdges[] = {0,      1,       10,       100,       1000,      10000,
                               100000, 1000000, 10000000, 100000000, 1000000000};

// Puts record and line at the two ends of a page; what lies around it cannot be accessed.
class LineKernelTest : public testing::TestWithParam<morwick::LineKernel> {
 protected:
  void SetUp() override {
    if (!GetParam().runs()) GTEST_SKIP() << "this processor has no " << GetParam().name;
    void *pages = mmap(nullptr, 3 * kPage, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    page_ = static_cast<char *>(pages) + kPage;
    ASSERT_EQ(mprotect(page_, kPage, PROT_READ | PROT_WRITE), 0);
  }

  // The record lies at one end and at the other by turns.
  void Check(const Words &words) {
    recordFirst_ = !recordFirst_;
    char *record = recordFirst_ ? page_ : page_ + kPage - sizeof words;
    char *line = recordFirst_ ? page_ + kPage - morwick::kLineRoom : page_;
    std::memcpy(record, words.data(), sizeof words);
    const auto *bytes = reinterpret_cast<const uint8_t *>(record);
    char expected[morwick::kLineRoom];
    ASSERT_EQ(std::string_view(line, GetParam().write(line, bytes)),
              std::string_view(expected, morwick::WriteLine(expected, bytes)));
  }

  // A number of any length, or one of the three around a power of ten or 0; 0 - 1 is the largest.
  uint32_t AnyNumber() {
    const uint64_t random = random_();
    const uint32_t any = static_cast<uint32_t>(random >> 32) >> random % 32;
    return random % 64 < 32 ? any : kEdges[random / 64 % std::size(kEdges)] + any % 3 - 1;
  }

  char *page_ = nullptr;
  bool recordFirst_ = false;
  std::mt19937_64 random_{1};
};

INSTANTIATE_TEST_SUITE_P(Each, LineKernelTest, testing::ValuesIn(morwick::LineKernels()));

TEST_P(LineKernelTest, WritesRandomLines) {
#ifdef NDEBUG
  constexpr int kRounds = 10000000;
#else
  constexpr int kRounds = 20000;
#endif
  Words words;
  for (int round = 0; round < kRounds && !HasFailure(); ++round) {
    std::ranges::generate(words, [&] { return AnyNumber(); });
    Check(words);
  }
}

// scripts/every-value runs this test.
TEST_P(LineKernelTest, DISABLED_WritesEveryValue) {
  Words words = {};
  do Check(words);
  while (++words[0] != 0 && !HasFailure());
}

}  // namespace
