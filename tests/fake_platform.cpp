#include "tests/fake_platform.h"

#include <cstdarg>
#include <cstdio>
#include <memory>

#include "morwick/exporter.h"
#include "morwick/platform.h"
#include "tests/unit_test.h"

struct MatchingRequest {
  std::string className;
};

namespace {

struct FakePlatform {
  Script script;
  std::ostringstream journal;
  size_t calls = 0;  // of those that can fail
  std::map<std::string, size_t> callsByName;
  std::map<uint32_t, std::string> openHandles;
  uint32_t lastHandle = 0;
};

FakePlatform platform;

template <typename... Parts>
void Write(const Parts &...parts) {
  (platform.journal << ... << parts) << "\n";
}

bool Lists(const std::string &key, const std::string &word) {
  return (" " + platform.script[key] + " ").find(" " + word + " ") != std::string::npos;
}

// Takes the key's next word off the script; returns `otherwise` when none is left.
std::string Take(const std::string &key, const std::string &otherwise) {
  std::string &words = platform.script[key];
  if (words.empty()) return otherwise;
  std::string word = words.substr(0, words.find(' '));
  words.erase(0, word.size() + 1);
  return word;
}

bool Fails(const std::string &name) {
  ++platform.calls;
  return Lists("failing", name + "#" + std::to_string(++platform.callsByName[name])) ||
         Lists("failing", "#" + std::to_string(platform.calls));
}

// A failure's code is negative unless the script has another.
int32_t Result(bool fails) {
  const std::string &code = platform.script["failure"];
  if (!fails) return 0;
  return code.empty() ? INT32_MIN : static_cast<int32_t>(Number(code));
}

// Handles need all their 32 bits, the highest one too; in the journal the n-th is n.
constexpr uint32_t kHandleStep = 0x10001;
constexpr uint32_t kHandleBit = 0x80000000;
constexpr uint32_t kLeftover = 0xdeadbeef;  // what a failed open may leave; it is no handle

uint32_t Issue(const std::string &what) {
  platform.lastHandle += kHandleStep;
  platform.openHandles[kHandleBit | platform.lastHandle] = what;
  return kHandleBit | platform.lastHandle;
}

std::string NameOf(uint32_t handle) {
  const uint32_t number = (handle & ~kHandleBit) / kHandleStep;
  const bool isIssued = number > 0 && handle == (kHandleBit | number * kHandleStep);
  if (handle == 0 || isIssued) return std::to_string(number);
  return handle == kLeftover ? "leftover" : "no handle, " + std::to_string(handle);
}

void Return(uint32_t handle, const std::string &what) {
  EXPECT_EQ(platform.openHandles[handle], what) << NameOf(handle) << " is not open";
  platform.openHandles.erase(handle);
}

}  // namespace

std::string Play(const Script &script, const std::function<void()> &body) {
  platform = FakePlatform();
  platform.script = script;
  testing::internal::CaptureStdout();
  testing::internal::CaptureStderr();
  body();
  std::string printed = testing::internal::GetCapturedStdout();
  printed += testing::internal::GetCapturedStderr();
  EXPECT_EQ(platform.openHandles, decltype(platform.openHandles)()) << "left open";
  return (printed.empty() ? "" : printed + "\n") + platform.journal.str();
}

void PlayCases(const std::string &file, const std::function<void(Script &)> &body) {
  ForEachCase(file, [&](std::istringstream &lines) {
    Script script;
    std::string line, expected;
    for (std::getline(lines, line); std::getline(lines, line) && line != "->";) {
      const size_t colon = line.find(": ");
      ASSERT_NE(colon, line.npos) << "no key: " << line;
      script[line.substr(0, colon)] = line.substr(colon + 2);
    }
    while (std::getline(lines, line)) expected += line + "\n";
    EXPECT_EQ(Play(script, [&] { body(script); }), expected);
  });
}

std::vector<std::string> PlayEveryFailure(Script script, const std::function<void()> &body) {
  std::vector<std::string> outcomes;
  for (size_t first = 0, calls = 1; first <= calls; ++first) {
    for (size_t second = first; second <= calls; ++second) {
      script["failing"] = "#" + std::to_string(first) + " #" + std::to_string(second);
      SCOPED_TRACE(script["failing"]);
      outcomes.push_back(Play(script, body));
      EXPECT_LE(platform.calls, 20U) << "an endless run";
      calls = std::clamp<size_t>(platform.calls, calls, 20);
    }
  }
  return outcomes;
}

// A search writes one line when it begins, at the first row, and one for each controller it finds.
MatchingRequest *ServiceMatching(const char *className) {
  if (className == std::string_view(nand_exporters[0].className)) Write("search");
  return Fails("match") ? nullptr : new MatchingRequest{className};
}

uint32_t GetMatchingService(MatchingRequest *request) {
  const std::unique_ptr<MatchingRequest> owned(request);
  if (!Lists("present", request->className) || Fails("lookup")) return 0;
  const uint32_t service = Issue("service");
  Write("find ", request->className, " = ", NameOf(service));
  return service;
}

int32_t OpenService(uint32_t service, uint32_t type, uint32_t *connection) {
  EXPECT_EQ(platform.openHandles[service], "service");
  const bool fails = Fails("open");
  *connection = fails && Lists("failing", "leftover") ? kLeftover : 0;
  if (!fails && !Lists("failing", "handle0")) *connection = Issue("connection");
  Write("open ", NameOf(service), " type ", type, " = ", NameOf(*connection));
  return Result(fails);
}

int32_t CloseService(uint32_t connection) {
  Write("close ", NameOf(connection));
  if (connection == 0 || connection == kLeftover) return 1;
  Return(connection, "connection");
  return Result(Fails("close"));
}

int32_t ReleaseObject(uint32_t service) {
  Write("release ", NameOf(service));
  Return(service, "service");
  return Result(Fails("release"));
}

int32_t CallStructMethod(uint32_t connection, uint32_t selector, const void *input,
                         size_t inputSize, void *reply, size_t *replySize) {
  EXPECT_EQ(platform.openHandles[connection], "connection");
  const auto *bytes = static_cast<const unsigned char *>(input);
  const auto *words = static_cast<const uint32_t *>(input);
  Write("call ", NameOf(connection), " method ", selector, ": ", inputSize, " bytes, ", words[0],
        " ", words[1], " and ", std::count(bytes + 8, bytes + inputSize, 0), " zeros");
  auto *pending = static_cast<uint32_t *>(reply);
  EXPECT_TRUE(*replySize == 4 && *pending == 0);
  *pending = static_cast<uint32_t>(Number(Take("replies", "0")));
  *replySize = 1;  // the caller must ignore it, and set it to 4 again for the next call
  // The pair is a writable global: each request must read it anew.
  const std::string second = std::to_string(taskSchedulerSelectors.second);
  taskSchedulerSelectors.second = static_cast<uint32_t>(Number(Take("commands", second)));
  return Result(Fails("call"));
}

void RegisterActivity(const char *identifier, ActivityCriteria criteria, ActivityHandler) {
  Write("register ", identifier, criteria == kActivityCheckIn ? " at check-in" : "");
}

int GetActivityState(Activity *) {
  return static_cast<int>(Number(Take("state", std::to_string(kActivityStateRun))));
}

bool ActivityShouldDefer(Activity *) {
  const bool answer = Take("defers", "no") == "yes";
  Write("defer? ", answer ? "yes" : "no");
  return answer;
}

bool SetActivityState(Activity *, int state) {
  Write("set state ", state);
  return !platform.script.contains("keeps state");
}

void ExitTransactionClean() { Write("exit clean"); }

void RunMainQueue() { std::abort(); }

void SystemLog(const char *format, ...) {
  char message[256];
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message, sizeof message, format, arguments);
  va_end(arguments);
  Write("log ", message);
}

extern "C" unsigned sleep(unsigned seconds) {
  Write("sleep ", seconds);
  return 0;
}
