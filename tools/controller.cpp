// Reads buffers from a controller through its driver.

#include "tools/controller.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <memory>
#include <new>

#include "tools/memory.h"
#include "tools/messages.h"

namespace tools {
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

// Connects, and releases the service, which an open connection does not need.
int32_t Open(uint32_t service, uint32_t *connection) {
  *connection = 0;
  const int32_t result = OpenService(service, kNandConnectionType, connection);
  ReleaseObject(service);
  return result;
}

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
  if (service == 0 && errno == ENOMEM) RefuseMemory();
  if (service == 0) return {};
  uint32_t connection = 0;
  const int32_t result = Open(service, &connection);
  if (connection != 0) CloseService(connection);
  return {true, connection != 0, result};
}

// From finding a service to storing the connection no statement may throw: the handle would leak.
Controller::Controller(const std::string &className, const std::string &what)
    : className_(className), what_(what) {
  NandExporter *row = FindRow(className);
  errno = 0;
  const uint32_t service = row == nullptr ? findNandExporter(&row) : MorwickFindService(row);
  if (service != 0) {
    row_ = row;
    const int32_t result = Open(service, &connection_);
    if (connection_ != 0) return;
    Complain(name() + ": " + what, "the connection was refused, result " + Hexadecimal(result));
  } else if (errno == ENOMEM) {
    RefuseMemory();
  } else if (className.empty()) {
    Complain(what, "no controller is present");
  } else {
    Complain(className + ": " + what, "the controller is not present");
  }
}

Controller::~Controller() {
  if (connection_ == 0) return;
  const int32_t result = CloseService(connection_);
  if (result == 0) return;
  try {
    Note(name() + ": " + what_, "closing the connection failed, result " + Hexadecimal(result));
  } catch (const std::bad_alloc &) {  // main complains of it
  }
}

std::optional<std::string> Controller::Read(const BufferKind &kind) {
  const std::string subject = name() + ": " + std::string(kind.name);
  if (!Offers(kind)) {
    Complain(subject, "this controller does not offer it");
    return std::nullopt;
  }
  MorwickBuffer buffer;
  const MorwickReadResult result =
      MorwickReadBuffer(connection_, row_, (row_->*kind.selectors)(), &buffer);
  const std::unique_ptr<MorwickBuffer, decltype(&MorwickFreeBuffer)> owned(&buffer,
                                                                           MorwickFreeBuffer);
  switch (result) {
    case kMorwickRead: return std::string(static_cast<const char *>(buffer.bytes), buffer.size);
    case kMorwickReadNoMemory: RefuseMemory();
    case kMorwickReadFailed:
      Complain(subject, "reading failed, result " + Hexadecimal(buffer.result));
      break;
    case kMorwickReadTooLarge:
      Complain(subject, "reading failed, the reply fills " + std::to_string(kMorwickLargestReply) +
                            " bytes");
      break;
  }
  return std::nullopt;
}

}  // namespace tools
