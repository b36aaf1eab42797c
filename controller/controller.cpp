// Finds the service of a class, and reads buffers.

#include "morwick/controller.h"

#include <cstddef>
#include <cstdlib>

#include "morwick/platform.h"

namespace {

constexpr size_t kFirstRoom = 64 << 10;  // bytes

static_assert(sizeof(MorwickRequest) == 24);
static_assert(offsetof(MorwickRequest, argument) == 4);

}  // namespace

uint32_t MorwickFindService(const NandExporter *row) {
  MatchingRequest *request = row == nullptr ? nullptr : ServiceMatching(row->className);
  return request == nullptr ? 0 : GetMatchingService(request);
}

MorwickReadResult MorwickReadBuffer(uint32_t connection, const NandExporter *row,
                                    const SelectorPair *selectors, MorwickBuffer *buffer) {
  if (buffer == nullptr) return kMorwickReadFailed;
  *buffer = {};
  if (row == nullptr || selectors == nullptr) return kMorwickReadFailed;
  const MorwickRequest request = MorwickMakeRequest(selectors, 0);
  for (size_t room = kFirstRoom; room <= kMorwickLargestReply; room *= 2) {
    void *bytes = std::malloc(room);
    if (bytes == nullptr) return kMorwickReadNoMemory;
    size_t size = room;
    buffer->result =
        CallStructMethod(connection, row->methodSelector, &request, sizeof request, bytes, &size);
    if (buffer->result == 0 && size < room) {
      buffer->bytes = bytes;
      buffer->size = size;
      return kMorwickRead;
    }
    std::free(bytes);
    if (buffer->result != 0) return kMorwickReadFailed;
  }
  return kMorwickReadTooLarge;
}

void MorwickFreeBuffer(MorwickBuffer *buffer) {
  if (buffer == nullptr) return;
  std::free(buffer->bytes);
  *buffer = {};
}
