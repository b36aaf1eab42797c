// The driver registry, the driver connections and the simulated controllers.

#include <endian.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstring>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <new>
#include <string>
#include <vector>

#include "morwick/platform.h"
#include "platform/simulated/files.h"
#include "platform/simulated/own_buffers.h"
#include "platform/simulated/scenario.h"

namespace simulated {
namespace {

// 0 is success; the other numbers are made up. As with real drivers some are negative.
enum Result : int32_t {
  kSuccess = 0,
  kBadHandle = 0x101,
  kBadArgument = 0x102,
  kRefused = static_cast<int32_t>(0xE0000103),
  kDeviceError = static_cast<int32_t>(0xE0000104),
  kNotOffered = 0x105,
  kNoMemory = 0x106,
};

constexpr uint32_t kTaskScheduler = 39;  // a command number, like those of kBuffers in scenario.h
constexpr uint32_t kTaskSchedulerArgument = 1025;
constexpr uint32_t kReadArgument = 0;
using Request = std::array<uint32_t, 6>;  // command, argument, zeros

enum class HandleKind { kService, kConnection };

struct Handle {
  HandleKind kind;
  Controller *controller;
};

const char *NameOf(HandleKind kind) {
  return kind == HandleKind::kService ? "service" : "connection";
}

// All state of the simulated drivers. Calls may come from any thread; Ask lets one in at a time.
class Drivers {
 public:
  Drivers() {
    const Scenario *scenario = TheScenario();
    if (scenario != nullptr) controllers_ = scenario->controllers;  // else a tool finds none
  }

  // At exit: a handle that is still open was leaked.
  ~Drivers() {
    for (const auto &[number, handle] : open_) {
      std::fprintf(stderr, "%s %u of %s is still open\n", NameOf(handle.kind), number,
                   handle.controller->className.c_str());
    }
  }

  // Calls the method on the one instance. Returns its answer, or `failure` when memory is refused.
  template <typename Answer>
  static Answer Ask(Answer failure, auto method, const auto &...arguments) {
    try {
      Drivers &drivers = Instance();
      const std::lock_guard lock(drivers.mutex_);
      return std::invoke(method, drivers, arguments...);
    } catch (const std::bad_alloc &) {
      return failure;
    }
  }

  uint32_t Find(const std::string &className) {
    const auto found = std::ranges::find(controllers_, className, &Controller::className);
    if (found == controllers_.end() || found->vanish.Hits()) return 0;
    return Issue({HandleKind::kService, &*found});
  }

  int32_t Open(uint32_t service, uint32_t type, uint32_t *connection) {
    *connection = 0;
    Controller *controller = ControllerOf(HandleKind::kService, service);
    if (controller == nullptr) return kBadHandle;
    if (controller->refuseOpen.Hits()) return kRefused;
    if (type != 0) return kBadArgument;
    *connection = Issue({HandleKind::kConnection, controller});
    return kSuccess;
  }

  // Even a close that fails closes the handle.
  int32_t Close(uint32_t connection) {
    Controller *controller = ControllerOf(HandleKind::kConnection, connection);
    if (controller == nullptr) return kBadHandle;
    open_.erase(connection);
    return controller->failClose.Hits() ? kDeviceError : kSuccess;
  }

  int32_t Release(uint32_t service) {
    if (ControllerOf(HandleKind::kService, service) == nullptr) return kBadHandle;
    open_.erase(service);
    return kSuccess;
  }

  // A call that fails writes nothing, so an answer goes into the reply only when it is whole.
  int32_t Call(uint32_t connection, uint32_t method, const void *input, size_t inputSize,
               void *reply, size_t *replySize) {
    Controller *controller = ControllerOf(HandleKind::kConnection, connection);
    if (controller == nullptr) return kBadHandle;
    Request request;
    if (method != RequestMethod(controller->className) || inputSize != sizeof request) {
      return kBadArgument;
    }
    std::memcpy(request.data(), input, sizeof request);
    if (!std::all_of(request.begin() + 2, request.end(), [](uint32_t word) { return word == 0; })) {
      return kBadArgument;
    }
    const uint32_t command = le32toh(request[0]);
    const uint32_t argument = le32toh(request[1]);
    std::string answer;
    const int32_t result = command == kTaskScheduler
                               ? DoUnit(controller, argument, *replySize, &answer)
                               : Read(controller, command, argument, *replySize, &answer);
    if (result == kSuccess) *replySize = answer.copy(static_cast<char *>(reply), *replySize);
    return result;
  }

 private:
  static Drivers &Instance() {
    static Drivers drivers;
    return drivers;
  }

  // Does one unit of work and answers with what is left.
  static int32_t DoUnit(Controller *controller, uint32_t argument, size_t room,
                        std::string *answer) {
    if (controller->failRequest.Hits()) return kDeviceError;
    if (argument != kTaskSchedulerArgument || room < sizeof(uint32_t)) return kBadArgument;
    if (controller->pending > 0) --controller->pending;
    const uint32_t word = htole32(controller->pending);
    answer->assign(reinterpret_cast<const char *>(&word), sizeof word);
    return kSuccess;
  }

  // Answers with a buffer, cut to the room: the next file in turn, or what the controller makes.
  static int32_t Read(Controller *controller, uint32_t command, uint32_t argument, size_t room,
                      std::string *answer) {
    const auto *buffer = std::ranges::find(kBuffers, command, &Buffer::command);
    if (buffer == kBuffers.end()) return kBadArgument;
    // Both faults count every read, so ask both before any return.
    const bool isShort = controller->shortRead.Hits();
    if (controller->failRead.Hits()) return kDeviceError;
    if (argument != kReadArgument) return kBadArgument;
    std::vector<std::string> &files = controller->files[buffer->key];
    if (files.empty()) {
      *answer = MakeOwnBuffer(buffer->key);
      if (answer->empty()) return kNotOffered;
      answer->resize(std::min(answer->size(), room));
    } else if (const int error = ReadFile(files[0], room, answer); error != 0) {
      Complain(Quoted(files[0]) + ": " + std::strerror(error));
      return kDeviceError;
    }
    // A reply that fills the room may be cut. The caller then asks again with more room and must
    // get the same file. The last file stays for all later reads.
    if (answer->size() < room && files.size() > 1) files.erase(files.begin());
    if (isShort) answer->resize(answer->size() / 2);
    return kSuccess;
  }

  // Numbers are never used twice, so that a late use of a handle cannot hit another one.
  uint32_t Issue(Handle handle) {
    open_.emplace(lastHandle_ + 1, handle);
    return ++lastHandle_;
  }

  // Null for a handle that is not open, after a line on standard error. 0 means no handle and is
  // refused without a line.
  Controller *ControllerOf(HandleKind kind, uint32_t number) {
    const auto found = open_.find(number);
    if (found != open_.end() && found->second.kind == kind) return found->second.controller;
    if (number != 0) {
      std::fprintf(stderr, "%s %u is %s\n", NameOf(kind), number,
                   found != open_.end()    ? "of another kind"
                   : number <= lastHandle_ ? "already released"
                                           : "unknown");
    }
    return nullptr;
  }

  std::mutex mutex_;
  std::vector<Controller> controllers_;  // with the work that is left and the files not read yet
  std::map<uint32_t, Handle> open_;
  uint32_t lastHandle_ = 0;
};

}  // namespace
}  // namespace simulated

using simulated::Drivers;
using simulated::kNoMemory;

struct MatchingRequest {
  std::string className;
};

MatchingRequest *ServiceMatching(const char *className) {
  if (className == nullptr) return nullptr;
  // Drivers are not needed, but Ask turns refused memory into null.
  return Drivers::Ask<MatchingRequest *>(
      nullptr, [=](const Drivers &) { return new MatchingRequest{className}; });
}

uint32_t GetMatchingService(MatchingRequest *request) {
  const std::unique_ptr<MatchingRequest> owned(request);
  return owned == nullptr ? 0 : Drivers::Ask<uint32_t>(0, &Drivers::Find, owned->className);
}

int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection) {
  return Drivers::Ask<int32_t>(kNoMemory, &Drivers::Open, service, type, connection);
}

int32_t CloseService(uint32_t connection) {
  return Drivers::Ask<int32_t>(kNoMemory, &Drivers::Close, connection);
}

int32_t ReleaseObject(uint32_t service) {
  return Drivers::Ask<int32_t>(kNoMemory, &Drivers::Release, service);
}

int32_t CallStructMethod(uint32_t connection, uint32_t selector, const void *input,
                         size_t inputSize, void *reply, size_t *replySize) {
  const auto result = Drivers::Ask<int32_t>(kNoMemory, &Drivers::Call, connection, selector, input,
                                            inputSize, reply, replySize);
  if (result != simulated::kSuccess) *replySize = 0;
  return result;
}
