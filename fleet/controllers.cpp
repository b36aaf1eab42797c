// Controllers and their buffers.

#include "fleet/controllers.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <memory>
#include <new>
#include <utility>

namespace fleet {
namespace {

constexpr BufferKind kBufferKinds[] = {
    {"statistics", &NandExporter::getStatsSelectors},
    {"msp", &NandExporter::getMSPStatsSelectors},
    {"snapshot", &NandExporter::getSnapshotSelectors},
    {"snapshot_header", &NandExporter::getSnapshotHeaderSelectors},
    {"band", &NandExporter::getBandStatsSelectors},
    {"defects", &NandExporter::getDefectsListSelectors},
    {"telemetry", &NandExporter::getTelemetryListSelectors},
};

}  // namespace

std::span<const BufferKind> BufferKinds() { return kBufferKinds; }

const BufferKind *FindBufferKind(std::string_view name) {
  if (name == "kvr" || name == "ftl") name = "statistics";
  const auto *found = std::ranges::find(kBufferKinds, name, &BufferKind::name);
  return found == std::end(kBufferKinds) ? nullptr : found;
}

std::string Hexadecimal(int32_t result) {
  std::array<char, 16> text;
  std::snprintf(text.data(), text.size(), "0x%x", static_cast<uint32_t>(result));
  return text.data();
}

std::span<NandExporter> KnownControllers() {
  size_t count = 0;
  while (nand_exporters[count].className != nullptr) ++count;
  return {nand_exporters, count};
}

NandExporter *FindRow(std::string_view className) {
  for (NandExporter &row : KnownControllers()) {
    if (className == row.className) return &row;
  }
  return nullptr;
}

Presence Probe(const NandExporter &row) {
  errno = 0;
  const uint32_t service = MorwickFindService(&row);
  if (service == 0 && errno == ENOMEM) throw std::bad_alloc();
  if (service == 0) return {};
  uint32_t connection = 0;
  const int32_t result = Open(service, &connection);
  if (connection != 0) CloseService(connection);
  return {true, connection != 0, result};
}

int32_t Open(uint32_t service, uint32_t *connection) {
  *connection = 0;
  const int32_t result = OpenService(service, kNandConnectionType, connection);
  ReleaseObject(service);
  // Against the contract, a driver that fails may still have stored a handle.
  if (result != 0 && *connection != 0) CloseService(std::exchange(*connection, 0));
  return result;
}

Reply ReadBuffer(uint32_t connection, const NandExporter &row, const BufferKind &kind) {
  if (row.*kind.selectors == nullptr) return {.fault = "this controller does not offer it"};
  MorwickBuffer buffer;
  const MorwickReadResult result =
      MorwickReadBuffer(connection, &row, (row.*kind.selectors)(), &buffer);
  const std::unique_ptr<MorwickBuffer, decltype(&MorwickFreeBuffer)> owned(&buffer,
                                                                           MorwickFreeBuffer);
  switch (result) {
    case kMorwickRead: break;
    case kMorwickReadNoMemory: throw std::bad_alloc();
    case kMorwickReadFailed:
      return {.fault = "reading failed, result " + Hexadecimal(buffer.result),
              .result = buffer.result};
    case kMorwickReadTooLarge:
      return {.fault = "reading failed, the reply fills " + std::to_string(kMorwickLargestReply) +
                       " bytes"};
  }
  return {.bytes = std::string(static_cast<const char *>(buffer.bytes), buffer.size)};
}

}  // namespace fleet
