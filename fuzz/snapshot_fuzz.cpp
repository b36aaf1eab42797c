// Fuzzes both snapshot renderings and the columns. Checks that the text holds each number of each
// column. The input: the room for text, the number of descriptors, a header with that many
// descriptors, and the snapshot, which is taken for a header too.

#include <cassert>
#include <cstddef>
#include <cstring>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "fleet/snapshot_header.h"
#include "morwick/morwick.h"
#include "tools/snapshot_columns.h"
#include "tools/text.h"

namespace {

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

std::string RenderDescribed(const std::vector<char> &header, std::string_view input, size_t room) {
  std::string whole;
  uint32_t state = 0;
  for (int call = 0; call < 50; ++call) {
    std::vector<char> output(room, 'x');
    const uint32_t before = state;
    uint64_t size = room;
    const uint64_t result = KVRParseSnapshotBufferWithInplaceParser(
        input.data(), input.size(), output.data(), &size, header.data(), &state);
    assert(state >= before);
    whole += TextIn(output, size - 1);
    if (result == 1) break;
    // A call makes progress, unless the banner does not fit: then it never will.
    assert(result == 0 && (state > before || (state == 0 && size == 1)));
  }
  return whole;
}

std::string RenderFixed(std::string_view input, size_t room) {
  std::vector<char> output(room, 'x');
  uint64_t size = room;
  const bool fits = KVRParseSnapshotBuffer(input.data(), input.size(), output.data(), &size) == 1;
  return TextIn(output, fits ? size : room - 1);
}

// Checks a header as it comes from outside and its columns: names differ, numbers lie in the
// record, and a line shows each of them.
void CheckColumns(std::vector<char> header, std::string_view snapshot, size_t room) {
  if (header.size() < sizeof(SnapshotHeader)) return;
  const uint32_t count = 3;  // one more than there are: the last one counted is never printed
  std::memcpy(&header[offsetof(SnapshotHeader, recordCount)], &count, sizeof count);
  if (!fleet::CheckSnapshotHeader({header.data(), header.size()}).empty()) return;
  RenderDescribed(header, snapshot, room);
  const tools::SnapshotColumns columns(header.data());
  assert(columns.fault().empty() != columns.all().empty());
  std::set<std::string> names;
  const uint32_t recordSize = LoadLittleEndian32(&header[offsetof(SnapshotHeader, recordSize)]);
  for (const tools::SnapshotColumn &column : columns.all()) {
    assert(tools::IsValidText(column.name) && names.insert(column.name).second);
    assert(column.offset + 4ULL <= recordSize);
  }
  // The line of the record as record 1 after an empty record 0, or null when it does not fit. From
  // state 1 no banner is printed.
  const auto lineOf = [&](const std::string &record) {
    const std::string two = std::string(recordSize, '\0') + record;
    std::vector<char> output(room);
    uint32_t state = 1;
    uint64_t size = room;
    const bool fits = KVRParseSnapshotBufferWithInplaceParser(two.data(), two.size(), output.data(),
                                                              &size, header.data(), &state) == 1;
    return fits ? std::optional<std::string>(output.data()) : std::nullopt;
  };
  for (; snapshot.size() >= recordSize; snapshot.remove_prefix(recordSize)) {
    std::string record(snapshot.substr(0, recordSize));
    const std::optional<std::string> line = lineOf(record);
    if (!line || !columns.fault().empty()) continue;
    assert(columns.LeavesOut(record) == line->empty());
    for (const tools::SnapshotColumn &column : columns.all()) {
      record[column.offset + 3] ^= 1;  // no format hides a change of the highest byte
      assert(line->empty() || lineOf(record) != line);
      record[column.offset + 3] ^= 1;
    }
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size < 3) return 0;
  const size_t room = size_t{1} + data[0] + size_t{16} * data[1];
  std::string_view input(reinterpret_cast<const char *>(data) + 3, size - 3);
  const std::vector<char> header = HeaderFrom(input, data[2] % 40);
  // The same input gives the same text: nothing uninitialised is printed.
  assert(RenderDescribed(header, input, room) == RenderDescribed(header, input, room));
  CheckColumns(header, input, room);
  CheckColumns({input.begin(), input.end()}, input, room);  // its table may lie anywhere
  assert(RenderFixed(input, room) == RenderFixed(input, room));
  return 0;
}
