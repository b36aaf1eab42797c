// Reads buffers from a controller through its driver.

#include "tools/controller.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <new>

#include "tools/io.h"

namespace tools {
namespace {

constexpr size_t kFirstRoom = 64 << 10;
constexpr size_t kMostRoom = 16 << 20;

// The shape of every request; a buffer is read with an argument of 0.
struct Request {
  uint32_t command;
  uint32_t argument;
  uint8_t reserved[16];
};
static_assert(sizeof(Request) == 24);

constexpr BufferKind kBufferKinds[] = {
    {"statistics", &NandExporter::getStatsSelectors},
    {"msp", &NandExporter::getMSPStatsSelectors},
    {"snapshot", &NandExporter::getSnapshotSelectors},
    {"snapshot_header", &NandExporter::getSnapshotHeaderSelectors},
    {"band", &NandExporter::getBandStatsSelectors},
    {"defects", &NandExporter::getDefectsListSelectors},
    {"telemetry", &NandExporter::getTelemetryListSelectors},
};

uint32_t FindService(const NandExporter &row) {
  return GetMatchingService(ServiceMatching(row.className));
}

// Connects and gives the service back; the connection stays open without it.
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
  const uint32_t service = FindService(row);
  if (service == 0 && errno == ENOMEM) throw std::bad_alloc();
  if (service == 0) return {};
  uint32_t connection = 0;
  const int32_t result = Open(service, &connection);
  if (connection != 0) CloseService(connection);
  return {true, connection != 0, result};
}

// Nothing between finding and keeping a handle may throw.
Controller::Controller(const std::string &className, const std::string &what)
    : className_(className), what_(what) {
  NandExporter *row = FindRow(className);
  errno = 0;
  const uint32_t service = row == nullptr ? findNandExporter(&row) : FindService(*row);
  if (service != 0) {
    row_ = row;
    const int32_t result = Open(service, &connection_);
    if (connection_ != 0) return;
    Complain(name() + ": " + what, "the connection was refused, result " + Hexadecimal(result));
  } else if (errno == ENOMEM) {
    throw std::bad_alloc();
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
  } catch (const std::bad_alloc &) {  // main says so
  }
}

std::optional<std::string> Controller::Read(const BufferKind &kind) {
  const std::string subject = name() + ": " + std::string(kind.name);
  if (!Offers(kind)) {
    Complain(subject, "this controller does not offer it");
    return std::nullopt;
  }
  const Request request = {
      .command = LittleEndian32((row_->*kind.selectors)()->second), .argument = 0, .reserved = {}};
  std::string reply;
  // A reply that fills the room may have been cut: it is asked for again with twice the room.
  for (size_t room = kFirstRoom; room <= kMostRoom; room *= 2) {
    reply.resize(room);
    size_t size = room;
    const int32_t result = CallStructMethod(connection_, row_->methodSelector, &request,
                                            sizeof request, reply.data(), &size);
    if (result != 0) {
      Complain(subject, "reading failed, result " + Hexadecimal(result));
      return std::nullopt;
    }
    if (size < room) {
      reply.resize(size);
      return reply;
    }
  }
  Complain(subject, "reading failed, the reply fills " + std::to_string(kMostRoom) + " bytes");
  return std::nullopt;
}

}  // namespace tools
