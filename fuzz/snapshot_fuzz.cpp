// Both snapshot renderings. The input: a capacity, the number of descriptors, a header with so many
// descriptors, and the snapshot.

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <string>
#include <vector>

#include "fuzz/fuzz.h"
#include "morwick/morwick.h"

namespace {

constexpr size_t kTableOffset = sizeof(SnapshotHeader) + 12;

// Exactly as large as it must be, so that a byte too many is seen.
std::vector<char> HeaderFrom(std::string_view &input, size_t descriptors) {
  std::vector<char> header(kTableOffset + 8 + descriptors * sizeof(SnapshotFieldDescriptor));
  const size_t taken = input.copy(header.data(), header.size());
  input.remove_prefix(taken);
  const auto offset = static_cast<uint32_t>(kTableOffset);
  const auto count = static_cast<uint32_t>(descriptors);
  std::memcpy(&header[offsetof(SnapshotHeader, descriptorTableOffset)], &offset, sizeof offset);
  std::memcpy(&header[kTableOffset], &count, sizeof count);
  header[kTableOffset - 1] = '\0';  // the text's end
  return header;
}

void CheckText(const std::vector<char> &output, uint64_t length) {
  Require(length < output.size());
  Require(std::memchr(output.data(), '\0', output.size()) == output.data() + length);
}

std::string RenderInplace(const std::vector<char> &header, const std::vector<char> &snapshot,
                          size_t capacity) {
  std::string whole;
  uint32_t state = 0;
  for (int call = 0; call < 50; ++call) {
    std::vector<char> output(capacity, 'x');
    const uint32_t before = state;
    uint64_t size = capacity;
    const uint64_t result = KVRParseSnapshotBufferWithInplaceParser(
        snapshot.data(), snapshot.size(), output.data(), &size, header.data(), &state);
    Require(result <= 1 && state >= before && size >= 1);
    CheckText(output, size - 1);
    whole += output.data();
    if (result == 1) break;
    if (state == before) Require(state == 0 && size == 1);
  }
  return whole;
}

std::string RenderFixed(const std::vector<char> &snapshot, size_t capacity) {
  std::vector<char> output(capacity, 'x');
  uint64_t size = capacity;
  const uint64_t result =
      KVRParseSnapshotBuffer(snapshot.data(), snapshot.size(), output.data(), &size);
  CheckText(output, result == 1 ? size : capacity - 1);
  return output.data();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size < 3) return 0;
  const size_t capacity = size_t{1} + data[0] + size_t{16} * data[1];
  std::string_view input(reinterpret_cast<const char *>(data) + 3, size - 3);
  const std::vector<char> header = HeaderFrom(input, data[2] % 40);
  const std::vector<char> snapshot(input.begin(), input.end());
  Require(RenderInplace(header, snapshot, capacity) == RenderInplace(header, snapshot, capacity));
  Require(RenderFixed(snapshot, capacity) == RenderFixed(snapshot, capacity));
  return 0;
}
