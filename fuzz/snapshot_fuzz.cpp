// Both snapshot renderings. The input: a capacity, the number of descriptors, a header with so many
// descriptors, and the snapshot.

#include <cassert>
#include <cstddef>
#include <cstring>
#include <string>
#include <vector>

#include "morwick/morwick.h"

namespace {

constexpr uint32_t kTableOffset = sizeof(SnapshotHeader) + 12;

// Exactly as large as it must be, so that a byte too many is seen.
std::vector<char> HeaderFrom(std::string_view &input, uint32_t descriptors) {
  std::vector<char> header(kTableOffset + 8 + descriptors * sizeof(SnapshotFieldDescriptor));
  input.remove_prefix(input.copy(header.data(), header.size()));
  std::memcpy(&header[offsetof(SnapshotHeader, descriptorTableOffset)], &kTableOffset, 4);
  std::memcpy(&header[kTableOffset], &descriptors, 4);
  header[kTableOffset - 1] = '\0';  // the text's end
  return header;
}

// The text in a buffer, which must be so long and end in the buffer.
std::string TextIn(const std::vector<char> &output, uint64_t length) {
  assert(length < output.size());
  assert(std::memchr(output.data(), '\0', output.size()) == output.data() + length);
  return {output.data(), length};
}

std::string RenderDescribed(const std::vector<char> &header, const std::vector<char> &snapshot,
                            size_t capacity) {
  std::string whole;
  uint32_t state = 0;
  for (int call = 0; call < 50; ++call) {
    std::vector<char> output(capacity, 'x');
    const uint32_t before = state;
    uint64_t size = capacity;
    const uint64_t result = KVRParseSnapshotBufferWithInplaceParser(
        snapshot.data(), snapshot.size(), output.data(), &size, header.data(), &state);
    assert(state >= before);
    whole += TextIn(output, size - 1);
    if (result == 1) break;
    assert(result == 0 && (state > before || (state == 0 && size == 1)));
  }
  return whole;
}

std::string RenderFixed(const std::vector<char> &snapshot, size_t capacity) {
  std::vector<char> output(capacity, 'x');
  uint64_t size = capacity;
  const bool fits =
      KVRParseSnapshotBuffer(snapshot.data(), snapshot.size(), output.data(), &size) == 1;
  return TextIn(output, fits ? size : capacity - 1);
}

// Where no record is to be printed, a header may end with its text.
void CheckWithoutTable(std::vector<char> header, const std::vector<char> &snapshot,
                       size_t capacity) {
  const uint32_t one = 1;
  std::memcpy(&header[offsetof(SnapshotHeader, recordCount)], &one, sizeof one);
  const std::vector<char> alone(header.begin(), header.begin() + kTableOffset);
  assert(RenderDescribed(alone, snapshot, capacity) == RenderDescribed(header, snapshot, capacity));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size < 3) return 0;
  const size_t capacity = size_t{1} + data[0] + size_t{16} * data[1];
  std::string_view input(reinterpret_cast<const char *>(data) + 3, size - 3);
  const std::vector<char> header = HeaderFrom(input, data[2] % 40);
  const std::vector<char> snapshot(input.begin(), input.end());
  assert(RenderDescribed(header, snapshot, capacity) ==
         RenderDescribed(header, snapshot, capacity));
  CheckWithoutTable(header, snapshot, capacity);
  assert(RenderFixed(snapshot, capacity) == RenderFixed(snapshot, capacity));
  return 0;
}
