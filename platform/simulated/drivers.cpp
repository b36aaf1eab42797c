// The driver registry, the driver connections and the simulated controllers.

#include <endian.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <map>
#include <memory>
#include <mutex>
#include <new>
#include <optional>
#include <string>
#include <vector>

#include "morwick/platform.h"
#include "platform/simulated/files.h"
#include "platform/simulated/own_buffers.h"
#include "platform/simulated/scenario.h"

namespace simulated {
namespace {

enum Result : int32_t {
  kSuccess = 0,
  kBadHandle = 0x101,
  kBadArgument = 0x102,
  kRefused = 0x103,
  kDeviceError = 0x104,
  kNotOffered = 0x105,
  kNoMemory = 0x106,
};

// The driver has its own copies of these numbers, so that tests notice a wrong one in the library.
constexpr size_t kRequestSize = 24;  // command, argument, zeros
constexpr size_t kRequestZeros = 8;
constexpr uint32_t kTaskSchedulerArgument = 1025;
constexpr uint32_t kReadArgument = 0;

// A controller at work: its pending work, the files of its next reads, and how often it was called.
// Faults count the calls.
struct Device {
  const Controller *controller;
  uint32_t pending;
  uint32_t lookups = 0;
  uint32_t opens = 0;
  uint32_t requests = 0;
  uint32_t reads = 0;
  uint32_t closes = 0;
  std::map<uint32_t, size_t> nextFiles = {};  // by command
};

enum class HandleKind { kService, kConnection };

struct Handle {
  HandleKind kind;
  Device *device;
};

const char *NameOf(HandleKind kind) {
  return kind == HandleKind::kService ? "service" : "connection";
}

// The library has such a function too, but a platform may include only the contract.
uint32_t LoadWord(const void *bytes, size_t offset) {
  uint32_t word;
  std::memcpy(&word, static_cast<const char *>(bytes) + offset, sizeof word);
  return le32toh(word);
}

// All state of the simulated drivers. Calls may come from any thread.
class Drivers {
 public:
  static Drivers &Instance() {
    static Drivers drivers;
    return drivers;
  }

  Drivers() {
    const Scenario *scenario = TheScenario();
    if (scenario == nullptr) return;  // no controllers: a tool finds nothing
    for (const Controller &controller : scenario->controllers) {
      devices_.push_back({.controller = &controller, .pending = controller.pending});
    }
  }

  // At exit: a handle that is still open was leaked.
  ~Drivers() {
    for (const auto &[number, handle] : open_) {
      std::fprintf(stderr, "%s %u of %s is still open\n", NameOf(handle.kind), number,
                   handle.device->controller->className.c_str());
    }
  }

  uint32_t Find(const std::string &className) {
    const std::lock_guard lock(mutex_);
    for (Device &device : devices_) {
      if (device.controller->className != className) continue;
      if (device.controller->vanish.Hits(++device.lookups)) return 0;
      return Issue({HandleKind::kService, &device});
    }
    return 0;
  }

  int32_t Open(uint32_t service, uint32_t type, uint32_t *connection) {
    const std::lock_guard lock(mutex_);
    *connection = 0;
    Device *device = DeviceOf(HandleKind::kService, service);
    if (device == nullptr) return kBadHandle;
    if (device->controller->refuseOpen.Hits(++device->opens)) return kRefused;
    if (type != 0) return kBadArgument;
    *connection = Issue({HandleKind::kConnection, device});
    return kSuccess;
  }

  // A failed close leaves nothing open: there is no handle left to try it with again.
  int32_t Close(uint32_t connection) {
    const std::lock_guard lock(mutex_);
    Device *device = DeviceOf(HandleKind::kConnection, connection);
    if (device == nullptr) return kBadHandle;
    open_.erase(connection);
    return device->controller->failClose.Hits(++device->closes) ? kDeviceError : kSuccess;
  }

  int32_t Release(uint32_t service) {
    const std::lock_guard lock(mutex_);
    if (DeviceOf(HandleKind::kService, service) == nullptr) return kBadHandle;
    open_.erase(service);
    return kSuccess;
  }

  int32_t Call(uint32_t connection, uint32_t method, const void *input, size_t inputSize,
               void *reply, size_t *replySize) {
    const std::lock_guard lock(mutex_);
    Device *device = DeviceOf(HandleKind::kConnection, connection);
    if (device == nullptr) return kBadHandle;
    const size_t room = *replySize;
    if (method != RequestMethod(device->controller->className) || inputSize != kRequestSize) {
      return kBadArgument;
    }
    const auto *request = static_cast<const char *>(input);
    const bool zeros =
        std::all_of(request + kRequestZeros, request + kRequestSize, [](char c) { return c == 0; });
    if (!zeros) return kBadArgument;
    const uint32_t command = LoadWord(request, 0);
    const uint32_t argument = LoadWord(request, 4);
    if (command == kTaskScheduler) return DoUnit(device, argument, reply, room, replySize);
    if (std::ranges::any_of(kBuffers,
                            [&](const Buffer &each) { return each.command == command; })) {
      return Read(device, command, argument, reply, room, replySize);
    }
    return kBadArgument;
  }

 private:
  // Does one unit of work and answers with what is left.
  static int32_t DoUnit(Device *device, uint32_t argument, void *reply, size_t room,
                        size_t *replySize) {
    if (device->controller->failRequest.Hits(++device->requests)) return kDeviceError;
    if (argument != kTaskSchedulerArgument || room < sizeof(uint32_t)) return kBadArgument;
    if (device->pending > 0) --device->pending;
    const uint32_t word = htole32(device->pending);
    std::memcpy(reply, &word, sizeof word);
    *replySize = sizeof word;
    return kSuccess;
  }

  // Answers with a buffer, cut to the room: the next file in turn, or what the controller makes.
  static int32_t Read(Device *device, uint32_t command, uint32_t argument, void *reply, size_t room,
                      size_t *replySize) {
    const Controller &controller = *device->controller;
    const uint32_t read = ++device->reads;
    if (controller.failRead.Hits(read)) return kDeviceError;
    if (argument != kReadArgument) return kBadArgument;
    const std::vector<std::string> &files = controller.files.at(command);
    size_t &next = device->nextFiles[command];
    size_t size = 0;
    if (files.empty()) {
      const std::optional<size_t> made = MakeOwnBuffer(command, reply, room);
      if (!made) return kNotOffered;
      size = *made;
    } else {
      // A failed call writes nothing, so the bytes go into the reply only when all of them are
      // read.
      const auto bytes = std::make_unique_for_overwrite<char[]>(room);
      if (const int error = ReadFile(files[next].c_str(), bytes.get(), room, &size); error != 0) {
        Complain(Quoted(files[next]) + ": " + std::strerror(error));
        return kDeviceError;
      }
      std::copy_n(bytes.get(), size, static_cast<char *>(reply));
    }
    // A reply that fills the room may be cut. The caller then asks again with more room and must
    // get the same file.
    const bool cut = size == room;
    if (controller.shortRead.Hits(read)) {
      // A caller that reads beyond a short reply must not find the rest of it there.
      std::fill_n(static_cast<char *>(reply) + size / 2, size - size / 2, '\0');
      size /= 2;
    }
    if (!cut && next + 1 < files.size()) ++next;
    *replySize = size;
    return kSuccess;
  }

  // Numbers are never used twice, so that a late use of a handle cannot hit another one.
  uint32_t Issue(Handle handle) {
    open_.emplace(lastHandle_ + 1, handle);
    return ++lastHandle_;
  }

  // Null for a handle that is not open, after a line on standard error. 0 means no handle and is
  // refused without a line.
  Device *DeviceOf(HandleKind kind, uint32_t number) {
    const auto found = open_.find(number);
    if (found != open_.end() && found->second.kind == kind) return found->second.device;
    if (number != 0) {
      std::fprintf(stderr, "%s %u is %s\n", NameOf(kind), number,
                   found != open_.end()    ? "of another kind"
                   : number <= lastHandle_ ? "already released"
                                           : "unknown");
    }
    return nullptr;
  }

  std::mutex mutex_;
  std::vector<Device> devices_;
  std::map<uint32_t, Handle> open_;
  uint32_t lastHandle_ = 0;
};

// Returns what `answer` returns, or `failure` when memory is refused.
template <typename Answer, typename Function>
Answer OrFailure(Answer failure, Function answer) {
  try {
    return answer();
  } catch (const std::bad_alloc &) {
    return failure;
  }
}

}  // namespace
}  // namespace simulated

using simulated::Drivers;
using simulated::OrFailure;

struct MatchingRequest {
  std::string className;
};

MatchingRequest *ServiceMatching(const char *className) {
  return OrFailure<MatchingRequest *>(nullptr, [=]() -> MatchingRequest * {
    if (className == nullptr) return nullptr;
    Drivers::Instance();
    return new MatchingRequest{className};
  });
}

uint32_t GetMatchingService(MatchingRequest *request) {
  const std::unique_ptr<MatchingRequest> owned(request);
  if (owned == nullptr) return 0;
  return OrFailure<uint32_t>(0, [&] { return Drivers::Instance().Find(owned->className); });
}

int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection) {
  return OrFailure<int32_t>(simulated::kNoMemory,
                            [=] { return Drivers::Instance().Open(service, type, connection); });
}

int32_t CloseService(uint32_t connection) {
  return OrFailure<int32_t>(simulated::kNoMemory,
                            [=] { return Drivers::Instance().Close(connection); });
}

int32_t ReleaseObject(uint32_t service) {
  return OrFailure<int32_t>(simulated::kNoMemory,
                            [=] { return Drivers::Instance().Release(service); });
}

int32_t CallStructMethod(uint32_t connection, uint32_t selector, const void *input,
                         size_t inputSize, void *reply, size_t *replySize) {
  const int32_t result = OrFailure<int32_t>(simulated::kNoMemory, [=] {
    return Drivers::Instance().Call(connection, selector, input, inputSize, reply, replySize);
  });
  if (result != simulated::kSuccess) *replySize = 0;
  return result;
}
