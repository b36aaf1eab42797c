// Fuzzes both snapshot renderings and the columns. Checks that the text holds each number of each
// column. The input: a capacity, the number of descriptors, a header with that many descriptors,
// and the snapshot.

#include <cassert>
#include <cstddef>
#include <cstdio>
#include <cstring>
#include <set>
#include <string>
#include <vector>

#include "fleet/snapshot_header.h"
#include "morwick/morwick.h"
#include "tools/snapshot_columns.h"
#include "tools/text.h"

namespace {

using tools::SnapshotColumn;

constexpr uint32_t kTableOffset = sizeof(SnapshotHeader) + 12;  // 12 bytes of text
constexpr uint32_t kFieldsOffset = kTableOffset + sizeof(SnapshotDescriptorTable);

// A header with no room after its descriptors, so that the sanitizer sees a read after them.
std::vector<char> HeaderFrom(std::string_view &input, uint32_t descriptors) {
  std::vector<char> header(kFieldsOffset + descriptors * sizeof(SnapshotFieldDescriptor));
  input.remove_prefix(input.copy(header.data(), header.size()));
  std::memcpy(&header[offsetof(SnapshotHeader, descriptorTableOffset)], &kTableOffset, 4);
  std::memcpy(&header[kTableOffset], &descriptors, 4);
  header[kTableOffset - 1] = '\0';  // the text's end
  return header;
}

// The text in a buffer. It must have this length, with its NUL in the buffer.
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
    // A call makes progress, unless the banner does not fit: then it never will.
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

// Prints the number by the format, which the library has checked: MorwickSnapshotFieldAt gave it.
std::string Printed(const MorwickSnapshotField &field, const char *format, uint32_t number) {
  std::vector<char> text(8192);  // more than the largest capacity, in which the text did fit
#pragma clang diagnostic ignored "-Wformat-nonliteral"
  const int length =
      field.kind == kMorwickFieldThousandths
          ? std::snprintf(text.data(), text.size(), format, number / 1000, number % 1000 / 10)
          : std::snprintf(text.data(), text.size(), format, number);
  assert(length >= 0 && static_cast<size_t>(length) < text.size());
  return text.data();
}

// The fields lie in the record, and the numbers of the columns stand in the line in their order.
void CheckLine(const std::vector<char> &header, const std::vector<SnapshotColumn> &columns,
               std::string_view record, const std::string &line) {
  size_t at = 0;
  auto column = columns.begin();
  MorwickSnapshotField field;
  for (uint32_t i = 0; MorwickSnapshotFieldAt(header.data(), i, &field) == 1; ++i) {
    const char *format = &header[kFieldsOffset + i * sizeof(SnapshotFieldDescriptor) +
                                 offsetof(SnapshotFieldDescriptor, format)];
    const bool isTriple = field.kind == kMorwickFieldPriorities;
    const uint32_t count = isTriple                                   ? 3 * field.priorities
                           : field.kind == kMorwickFieldWithoutNumber ? 0
                                                                      : 1;
    for (uint32_t k = 0; k < count; ++k, ++column) {
      assert(column != columns.end() && column->offset + 4ULL <= record.size());
      const uint32_t number = LoadLittleEndian32(&record[column->offset]);
      const std::string text = isTriple ? std::to_string(number) : Printed(field, format, number);
      at = line.find(text, at);
      assert(at != std::string::npos);
      at += text.size();
    }
  }
  assert(column == columns.end());
}

// Renders each record as record 1 after an empty record 0: from state 1 no banner is printed.
void CheckColumns(std::vector<char> header, std::string_view snapshot, size_t capacity) {
  if (!fleet::CheckSnapshotHeader({header.data(), header.size()}).empty()) return;
  const tools::SnapshotColumns columns(header.data());
  std::set<std::string> names;
  for (const SnapshotColumn &column : columns.all()) {
    assert(tools::IsValidText(column.name) && names.insert(column.name).second);
  }
  const uint32_t recordSize = LoadLittleEndian32(&header[offsetof(SnapshotHeader, recordSize)]);
  const uint32_t count = 3;  // one more than there are: the last one counted is never printed
  std::memcpy(&header[offsetof(SnapshotHeader, recordCount)], &count, sizeof count);
  for (; snapshot.size() >= recordSize; snapshot.remove_prefix(recordSize)) {
    const std::string_view record = snapshot.substr(0, recordSize);
    std::vector<char> two(recordSize);
    two.insert(two.end(), record.begin(), record.end());
    std::vector<char> output(capacity);
    uint32_t state = 1;
    uint64_t size = capacity;
    const bool fits = KVRParseSnapshotBufferWithInplaceParser(two.data(), two.size(), output.data(),
                                                              &size, header.data(), &state) == 1;
    if (!fits || !columns.fault().empty()) continue;
    assert(columns.LeavesOut(record) == (size == 1));
    if (size > 1) CheckLine(header, columns.all(), record, {output.data(), size - 1});
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size < 3) return 0;
  const size_t capacity = size_t{1} + data[0] + size_t{16} * data[1];
  std::string_view input(reinterpret_cast<const char *>(data) + 3, size - 3);
  const std::vector<char> header = HeaderFrom(input, data[2] % 40);
  const std::vector<char> snapshot(input.begin(), input.end());
  // The same input gives the same text: nothing uninitialised is printed.
  assert(RenderDescribed(header, snapshot, capacity) ==
         RenderDescribed(header, snapshot, capacity));
  CheckColumns(header, input, capacity);
  assert(RenderFixed(snapshot, capacity) == RenderFixed(snapshot, capacity));
  return 0;
}
