#include "tests/fake_platform.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <sstream>

FakePlatform fakePlatform;

struct MatchingRequest {
  std::string className;
};

void FakePlatform::Reset(const std::map<std::string, std::string> &script) {
  *this = FakePlatform();
  for (const auto &[key, words] : script) {
    std::istringstream stream(words);
    for (std::string word; stream >> word;) {
      if (key == "present") present.insert(word);
      if (key == "failing") failing.insert(word);
      if (key == "replies") replies.push_back(word);
      if (key == "defers") defers.push_back(word);
      if (key == "state") activityState = std::stoi(word);
    }
  }
}

bool FakePlatform::Fails(const std::string &name) {
  ++calls;
  return failing.contains(name + "#" + std::to_string(++callsByName[name])) ||
         failing.contains("#" + std::to_string(calls));
}

uint32_t FakePlatform::Issue(const std::string &what) {
  openHandles[++lastHandle] = what;
  return lastHandle;
}

void FakePlatform::Return(uint32_t handle, const std::string &what) {
  const auto found = openHandles.find(handle);
  if (found == openHandles.end() || found->second != what) {
    ADD_FAILURE() << what << " " << handle << " is not open";
  } else {
    openHandles.erase(found);
  }
}

void PlatformTest::TearDown() {
  EXPECT_EQ(fakePlatform.openRequests, 0U) << "a matching request was not consumed";
  for (const auto &[handle, what] : fakePlatform.openHandles) {
    ADD_FAILURE() << what << " " << handle << " was left open";
  }
}

MatchingRequest *ServiceMatching(const char *className) {
  fakePlatform.Write(std::string("match ") + className);
  if (fakePlatform.Fails("match")) return nullptr;
  ++fakePlatform.openRequests;
  return new MatchingRequest{className};
}

uint32_t GetMatchingService(MatchingRequest *request) {
  --fakePlatform.openRequests;
  const bool found = fakePlatform.present.contains(request->className);
  delete request;
  const uint32_t service =
      found && !fakePlatform.Fails("lookup") ? fakePlatform.Issue("service") : 0;
  fakePlatform.Write("look up = " + std::to_string(service));
  return service;
}

int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection) {
  EXPECT_EQ(fakePlatform.openHandles[service], "service");
  const bool fails = fakePlatform.Fails("open");
  *connection =
      fails || fakePlatform.failing.contains("handle0") ? 0 : fakePlatform.Issue("connection");
  fakePlatform.Write("open " + std::to_string(service) + " type " + std::to_string(type) + " = " +
                     std::to_string(*connection));
  return fails ? 0x2c7 : 0;
}

int32_t CloseService(uint32_t connection) {
  fakePlatform.Write("close " + std::to_string(connection));
  if (connection == 0) return 1;
  fakePlatform.Return(connection, "connection");
  return fakePlatform.Fails("close") ? 1 : 0;
}

int32_t ReleaseObject(uint32_t service) {
  fakePlatform.Write("release " + std::to_string(service));
  fakePlatform.Return(service, "service");
  return fakePlatform.Fails("release") ? 1 : 0;
}

int32_t CallStructMethod(uint32_t connection, uint32_t selector, const void *input,
                         size_t inputSize, void *reply, size_t *replySize) {
  EXPECT_EQ(fakePlatform.openHandles[connection], "connection");
  EXPECT_EQ(*replySize, 4U);
  const auto *bytes = static_cast<const unsigned char *>(input);
  const auto zeros = std::count(bytes + 8, bytes + inputSize, 0);
  const auto half = [&](size_t offset) { return bytes[offset] + 256U * bytes[offset + 1]; };
  char line[100];
  std::snprintf(line, sizeof line, "call %u method %u: %u bytes, %u %u and %u zeros", connection,
                selector, static_cast<unsigned>(inputSize), half(0), half(4),
                static_cast<unsigned>(zeros));
  fakePlatform.Write(line);
  uint32_t word = 0;
  std::memcpy(&word, reply, sizeof word);
  EXPECT_EQ(word, 0U) << "the reply is not cleared before the call";
  if (!fakePlatform.replies.empty()) {
    word = static_cast<uint32_t>(std::stoul(fakePlatform.replies.front()));
    fakePlatform.replies.pop_front();
  }
  std::memcpy(reply, &word, sizeof word);
  return fakePlatform.Fails("call") ? 1 : 0;
}

void RegisterActivity(const char *identifier, ActivityCriteria criteria, ActivityHandler) {
  fakePlatform.Write(std::string("register ") + identifier +
                     (criteria == kActivityCheckIn ? " at check-in" : ""));
}

int GetActivityState(Activity *) { return fakePlatform.activityState; }

bool ActivityShouldDefer(Activity *) {
  const bool answer = !fakePlatform.defers.empty() && fakePlatform.defers.front() == "yes";
  if (!fakePlatform.defers.empty()) fakePlatform.defers.pop_front();
  fakePlatform.Write(answer ? "defer? yes" : "defer? no");
  return answer;
}

bool SetActivityState(Activity *, int state) {
  fakePlatform.Write("set state " + std::to_string(state));
  return true;
}

void ExitTransactionClean() { fakePlatform.Write("exit clean"); }

void RunMainQueue() { std::abort(); }

void SystemLog(const char *format, ...) {
  char message[256];
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message, sizeof message, format, arguments);
  va_end(arguments);
  fakePlatform.Write(std::string("log ") + message);
}

extern "C" unsigned sleep(unsigned seconds) {
  fakePlatform.Write("sleep " + std::to_string(seconds));
  return 0;
}
