// The simulated drivers: handles are checked, only the right requests are answered, and what a
// controller makes up is good for every parser. The simulated scheduler. Each test in a process of
// its own, with a scenario of its own.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/mman.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <fstream>
#include <functional>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "morwick/morwick.h"

namespace {

int64_t wallClock = 0;  // in milliseconds since 1970; 0 for the real one
std::string systemLog;
volatile int systemLogError = 0;

}  // namespace

// Takes the place of the system's log.
// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name): the C library's are reserved
extern "C" MORWICK_EXPORT ssize_t sendto(int, const void *text, size_t size, int flags,
                                         const sockaddr *log, socklen_t) {
  EXPECT_STREQ(reinterpret_cast<const sockaddr_un *>(log)->sun_path, "/dev/log");
  EXPECT_NE(flags & MSG_DONTWAIT, 0);
  errno = systemLogError;
  if (errno != 0) return -1;
  systemLog.append(static_cast<const char *>(text), size).push_back('\n');
  return static_cast<ssize_t>(size);
}

// Takes the place of the platform's, for the wall clock.
extern "C" MORWICK_EXPORT int clock_gettime(clockid_t clock, timespec *time) noexcept {
  if (clock != CLOCK_REALTIME || wallClock == 0) {
    return static_cast<int>(syscall(SYS_clock_gettime, clock, time));
  }
  *time = {.tv_sec = wallClock / 1000, .tv_nsec = wallClock % 1000 * 1'000'000};
  return 0;
}
// NOLINTEND(readability-inconsistent-declaration-parameter-name)

namespace {

constexpr int32_t kBadHandle = 0x101;
constexpr int32_t kBadArgument = 0x102;
constexpr int32_t kRefused = 0x103;
constexpr int32_t kDeviceError = 0x104;
constexpr int32_t kNotOffered = 0x105;

// A file in memory, by its name in the one folder where all of them are.
std::string File(const std::string &text) {
  const int file = memfd_create("file", 0);
  EXPECT_EQ(write(file, text.data(), text.size()), static_cast<ssize_t>(text.size()));
  return std::to_string(file);
}

void Play(const std::string &scenario) {
  setenv("GRELLON_SCENARIO", ("/proc/self/fd/" + File(scenario)).c_str(), 1);
}

uint32_t Find(const char *className = "KVRStorage") {
  return GetMatchingService(ServiceMatching(className));
}

uint32_t Connect(const char *className = "KVRStorage") {
  const uint32_t service = Find(className);
  uint32_t connection = 1;
  EXPECT_EQ(OpenService(service, 1, &connection), kBadArgument);
  EXPECT_EQ(connection, 0U);
  EXPECT_EQ(OpenService(service, 0, &connection), 0);
  EXPECT_EQ(ReleaseObject(service), 0);
  return connection;
}

std::string Read(uint32_t connection, uint32_t method, uint32_t command) {
  const uint32_t request[6] = {command};
  std::string reply(1 << 20, '\0');
  size_t size = reply.size();
  EXPECT_EQ(CallStructMethod(connection, method, request, sizeof request, reply.data(), &size), 0);
  reply.resize(size);
  return reply;
}

// Each line sends one request; what has gone before it counts. A room of 99 is more than there is.
TEST(SimulatedPlatformTest, AnswersTheRightRequestsOnly) {
  int fifo[2] = {};
  ASSERT_EQ(pipe(fifo), 0);
  ASSERT_EQ(write(fifo[1], "0123456789rest", 14), 14);
  Play(
      "[[controller]]\nclass = 'KVRStorage'\nvanish = [2]\npending = 3\nfail_request = [3]\n"
      "fail_read = [5]\nshort_read = [8, 19]\nmsp = '" +
      File("msp") + "'\nstatistics = ['" + File("first") + "', '/proc/self/fd/" + File("2nd") +
      "', '" + File("third") + "']\nsnapshot = '" + File("") +
      "'\nsnapshot_header = '/'\n"
      "defects = [\"/no\\n\\u007f\", '" +
      File("never") + "']\ntelemetry = '" + std::to_string(fifo[0]) + "'\n");
  close(STDIN_FILENO);  // a file that is read may well be descriptor 0
  const uint32_t connection = Connect();
  const std::string none;
  const struct {
    uint32_t method, command, argument, size, room;
    int32_t result;
    std::string reply;
    uint32_t beyond = 0;  // in the bytes that are to be 0, from the front or from behind
  } cases[] = {
      {9, 39, 1025, 24, 99, kBadArgument, none},
      {8, 38, 1025, 24, 99, kBadArgument, none},
      {8, 39, 1025, 23, 99, kBadArgument, none},
      {8, 39, 1025, 25, 99, kBadArgument, none},
      {8, 39, 1025, 24, 99, kBadArgument, none, 1},
      {8, 39, 1025, 24, 99, kBadArgument, none, 1U << 31},
      {8, 39, 1024, 24, 99, kBadArgument, none},
      {8, 39, 1025, 24, 3, kBadArgument, none},
      {8, 39, 1025, 24, 99, kDeviceError, none},
      {8, 39, 1025, 24, 4, 0, {"\2\0\0\0", 4}},
      {8, 39, 1025, 24, 99, 0, {"\1\0\0\0", 4}},
      {9, 13, 0, 24, 99, kBadArgument, none},
      {8, 13, 0, 23, 99, kBadArgument, none},
      {8, 13, 0, 24, 99, kBadArgument, none, 1},
      {8, 13, 0, 24, 4, 0, "firs"},
      {8, 221, 0, 24, 99, 0, "msp"},
      {8, 13, 0, 24, 5, 0, "first"},
      {8, 13, 0, 24, 0, 0, none},
      {8, 39, 1025, 24, 4, 0, {"\0\0\0\0", 4}},
      {8, 13, 0, 24, 99, kDeviceError, none},
      {8, 13, 1, 24, 99, kBadArgument, none},
      {8, 13, 0, 24, 6, 0, "first"},
      {8, 13, 0, 24, 3, 0, "2"},  // half of what fills the room was cut all the same
      {8, 13, 0, 24, 5, 0, "2nd"},
      {8, 13, 0, 24, 99, 0, "third"},
      {8, 13, 0, 24, 99, 0, "third"},
      {8, 221, 0, 24, 99, 0, "msp"},
      {8, 22, 0, 24, 99, 0, none},
      {8, 145, 0, 24, 99, kDeviceError, none},
      {8, 11, 0, 24, 99, kNotOffered, none},
      {8, 15, 0, 24, 99, kDeviceError, none},
      {8, 15, 0, 24, 99, kDeviceError, none},
      {8, 17, 0, 24, 10, 0, "0123456789"},
      {8, 13, 0, 24, 99, 0, "th"},
      {8, 39, 1025, 24, 4, 0, {"\0\0\0\0", 4}},
  };
  testing::internal::CaptureStderr();
  int line = 0;
  for (const auto &[method, command, argument, size, room, result, reply, beyond] : cases) {
    ++line;
    const uint32_t request[6] = {command, argument, beyond & 1, 0, 0, beyond & ~1U};
    std::string buffer(room + 1, '#');
    size_t replySize = room;
    EXPECT_EQ(CallStructMethod(connection, method, request, size, buffer.data(), &replySize),
              result)
        << "line " << line;
    EXPECT_EQ(buffer.substr(0, replySize), reply) << "line " << line;
    EXPECT_EQ(buffer.find_first_not_of({"#\0", 2}, replySize), std::string::npos)
        << "line " << line;
    EXPECT_EQ(buffer.back(), '#') << "line " << line;
  }
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "platform_tests: '/': Is a directory\n"
            "platform_tests: '/no\\x0a\\x7f': No such file or directory\n"
            "platform_tests: '/no\\x0a\\x7f': No such file or directory\n");
  std::string rest(99, '\0');
  EXPECT_EQ(read(fifo[0], rest.data(), rest.size()), 4) << "what there was no room for";
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_EQ(Find(), 0U) << "the second look-up finds it gone";
}

// The library's table and the simulated drivers' own list know the same classes and methods.
TEST(SimulatedPlatformTest, KnowsEachClassOfTheTable) {
  std::string scenario;
  for (const NandExporter *row = nand_exporters; row->className != nullptr; ++row) {
    scenario += std::string("[[controller]]\nclass = '") + row->className + "'\nband = '" +
                File(row->className) + "'\n";
  }
  Play(scenario);
  for (const NandExporter *row = nand_exporters; row->className != nullptr; ++row) {
    const uint32_t connection = Connect(row->className);
    EXPECT_EQ(Read(connection, row->methodSelector, row->getBandStatsSelectors()->second),
              row->className);
    EXPECT_EQ(CloseService(connection), 0);
  }
}

TEST(SimulatedPlatformTest, ServesTheExampleDumps) {
  setenv("GRELLON_SCENARIO", SOURCE "/packaging/scenarios/statistics.toml", 1);
  const uint32_t connection = Connect("VeltoQRN3NVMeController");
  const struct {
    uint32_t command;
    const char *file;
  } cases[] = {{13, "kvr.bin"},
               {13, "ftl.bin"},
               {221, "msp.bin"},
               {22, "snapshot.bin"},
               {145, "snapshot_header.bin"}};
  for (const auto &[command, file] : cases) {
    std::ostringstream dump;
    dump << std::ifstream(std::string(SOURCE "/examples/") + file).rdbuf();
    EXPECT_EQ(Read(connection, 9, command), dump.str()) << file;
  }
  CloseService(connection);
}

TEST(SimulatedPlatformTest, LogsToTheSystemAndToThePersonAtTheTerminal) {
  Play("");
  testing::internal::CaptureStderr();
  for (const char *text : {"100%", "line\n", ""}) SystemLog("%s", text);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "grellon: 100%\ngrellon: line\ngrellon: \n");
  std::istringstream lines(systemLog);
  for (const char *text : {"100%", "line", ""}) {
    std::string line;
    std::getline(lines, line);
    tm time = {};
    EXPECT_EQ(strptime(line.c_str() + 4, "%b %e %T ", &time), line.c_str() + 20) << line;
    // Facility daemon, level notice.
    EXPECT_EQ(line.erase(4, 16), "<29>grellon[" + std::to_string(getpid()) + "]: " + text);
  }
  EXPECT_EQ(lines.peek(), EOF);
}

// In the log 29 characters with the NUL: of the 16 KiB for lines that wait, 564 of them leave one
// too few for another.
constexpr char kLine[] = "line %013u";
constexpr unsigned long kWaiting = 564;

// All lines in their order but for one gap, which is told of, and not before so many lines.
void CheckOneGap(const std::string &log, unsigned long lines, unsigned long least) {
  std::istringstream stream(log);
  std::string line;
  unsigned long next = 1;
  int gaps = 0;
  while (std::getline(stream, line)) {
    std::string text = line.substr(std::min(line.size(), line.find(": ") + 2));
    if (text.ends_with('\r')) text.pop_back();
    if (text.starts_with("line ")) {
      std::array<char, 32> expected;
      std::snprintf(expected.data(), expected.size(), kLine, static_cast<unsigned>(next++));
      EXPECT_EQ(text, expected.data());
    } else {
      const unsigned long dropped = std::strtoul(text.c_str(), nullptr, 10);
      EXPECT_EQ(text, std::to_string(dropped) + " lines of the log were dropped");
      EXPECT_GT(next, least);
      next += dropped;
      ++gaps;
    }
  }
  EXPECT_EQ(next, lines + 1);
  EXPECT_EQ(gaps, 1);
}

// Nobody reads standard error or the system's log; then the one is read piece by piece, and the
// other is started anew.
void CheckFullLog(int reader, int writer) {
  Play("");
  fcntl(reader, F_SETFL, O_NONBLOCK);
  const int standardError = dup(STDERR_FILENO);
  dup2(writer, STDERR_FILENO);
  std::string log;
  systemLogError = EAGAIN;
  alarm(20);  // in case it waits
  unsigned line = 0;
  while (line < 20'000) SystemLog(kLine, ++line);
  int unread = 0;
  ioctl(reader, FIONREAD, &unread);
  systemLogError = ECONNREFUSED;
  SystemLog(kLine, ++line);
  systemLogError = 0;
  // A terminal hands a line on some time after it was written.
  pollfd more = {.fd = reader, .events = POLLIN, .revents = 0};
  while (line < 20'100 || poll(&more, 1, 200) > 0) {
    if (line < 20'100) SystemLog(kLine, ++line);
    std::array<char, 5000> some;
    const ssize_t size = read(reader, some.data(), some.size());
    if (size > 0) log.append(some.data(), static_cast<size_t>(size));
    usleep(1000);
  }
  alarm(0);
  EXPECT_EQ(fcntl(STDERR_FILENO, F_GETFL) & O_NONBLOCK, 0) << "others write there too";
  dup2(standardError, STDERR_FILENO);
  constexpr unsigned long kLineSize = 30;  // with a terminal's own line end
  CheckOneGap(log, line, static_cast<unsigned>(unread) / kLineSize + kWaiting);
  CheckOneGap(systemLog, line, 0);  // what waited went when there was no log
}

TEST(SimulatedPlatformTest, NeverWaitsForAPipe) {
  int ends[2] = {};
  ASSERT_EQ(pipe(ends), 0);
  CheckFullLog(ends[0], ends[1]);
}

TEST(SimulatedPlatformTest, NeverWaitsForASocket) {
  int ends[2] = {};
  ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, ends), 0);
  CheckFullLog(ends[0], ends[1]);
}

TEST(SimulatedPlatformTest, NeverWaitsForATerminal) {
  const int terminal = posix_openpt(O_RDWR | O_NOCTTY);
  ASSERT_EQ(grantpt(terminal) | unlockpt(terminal), 0);
  CheckFullLog(terminal, open(ptsname(terminal), O_RDWR | O_NOCTTY));
}

// The system's log takes lines again a quarter of a second after the end.
[[noreturn]] void EndWhileTheLogIsFull() {
  Play("");
  std::atexit([] { std::fputs(systemLog.c_str(), stderr); });  // after the log's own end
  std::signal(SIGALRM, [](int) { systemLogError = 0; });
  systemLogError = EAGAIN;
  SystemLog("last line");
  ualarm(250'000, 0);
  std::exit(0);
}

TEST(SimulatedPlatformDeathTest, GivesWhatWaitsForTheLogSomeTimeAtTheEnd) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(EndWhileTheLogIsFull(), testing::ExitedWithCode(0),
              "^grellon: last line\n<29>.*: last line\n$");
}

TEST(SimulatedPlatformTest, LeavesSignalsToATool) {
  Play("[[controller]]\nclass = 'KVRStorage'\n");
  CloseService(Connect());
  sigset_t blocked;
  pthread_sigmask(SIG_BLOCK, nullptr, &blocked);
  for (const int signal : {SIGHUP, SIGINT, SIGTERM, SIGUSR1, SIGPIPE, SIGXFSZ}) {
    struct sigaction action = {};
    sigaction(signal, nullptr, &action);
    EXPECT_TRUE(action.sa_handler == SIG_DFL && sigismember(&blocked, signal) == 0) << signal;
  }
}

std::vector<uint64_t> Values(const ContextNode *node) {
  std::vector<uint64_t> values;
  for (; node != nullptr; node = node->next) values.push_back(node->value);
  return values;
}

struct Statistics {
  std::vector<uint64_t> ftl, msp;
};

// What the controller makes of its statistics, through all three parsers.
Statistics CheckStatistics(uint32_t connection) {
  const std::string statistics = Read(connection, 9, 13);
  const std::string mspStatistics = Read(connection, 9, 221);
  const auto size = static_cast<uint32_t>(statistics.size());
  KVRStatsCxt kvr = {};
  GenericParserCxt ftl = {};
  GenericParserCxt msp = {};
  EXPECT_EQ(KVRParseBufferToCxt(&kvr, statistics.data(), size), 1);
  const uint32_t ftlCount = KVRFTLParseBufferToCxt(&ftl, statistics.data(), size);
  const uint64_t mspCount =
      KVRMSPParseBufferToCxt(&msp, mspStatistics.data(), mspStatistics.size());
  EXPECT_EQ(GlobalAPIErrorMessage, nullptr) << GlobalAPIErrorMessage;
  Statistics values = {.ftl = Values(ftl.valuesHead), .msp = Values(msp.valuesHead)};
  EXPECT_EQ(values.ftl.size(), ftlCount);
  EXPECT_EQ(values.msp.size(), mspCount);
  EXPECT_EQ(Values(kvr.valuesHead), values.ftl);
  const uint64_t summary[] = {kvr.exportVersion,
                              kvr.numVirtualBlocks,
                              kvr.blocksPerVirtualBlock,
                              kvr.pagesPerVirtualBlock,
                              kvr.bytesPerPage,
                              kvr.hostReads,
                              kvr.hostWrites,
                              kvr.numFreeVirtualBlocks,
                              kvr.wearLevMoves,
                              kvr.nandReads,
                              kvr.nandWrites,
                              kvr.bandErases,
                              kvr.IND_pool_free,
                              kvr.IND_pool_count,
                              kvr.utilFormatTime,
                              kvr.numSleepOps,
                              kvr.maxHighEnduranceBlockErases,
                              kvr.readCountHisto[4]};
  EXPECT_EQ(std::count(std::begin(summary), std::end(summary), 0), 0);
  EXPECT_TRUE(
      std::is_sorted(std::begin(kvr.readCountHisto), std::end(kvr.readCountHisto), std::greater()));
  KVRReleaseContext(&kvr);
  ReleaseGenericParserCxt(&ftl);
  ReleaseGenericParserCxt(&msp);
  return values;
}

// What the controller makes of its snapshot: sensible numbers, and by its header the same lines as
// in the fixed layout.
void CheckSnapshot(uint32_t connection, uint32_t lastSecond) {
  const std::string snapshot = Read(connection, 9, 22);
  const std::string header = Read(connection, 9, 145);
  std::string fixed(1 << 20, '\0');
  std::string described(1 << 20, '\0');
  uint64_t size = fixed.size();
  EXPECT_EQ(KVRParseSnapshotBuffer(snapshot.data(), snapshot.size(), fixed.data(), &size), 1U);
  fixed.resize(size);
  size = described.size();
  uint32_t state = 0;
  EXPECT_EQ(KVRParseSnapshotBufferWithInplaceParser(snapshot.data(), snapshot.size(),
                                                    described.data(), &size, header.data(), &state),
            1U);
  described.resize(size - 1);
  const std::string banner = "- KVR Snapshot - \nSimulated controller\n";
  EXPECT_EQ(described.substr(0, banner.size()), banner);
  EXPECT_EQ(fixed.substr(1337), described.substr(banner.size()) + "\n");

  std::vector<SnapshotRecord> records(120);
  ASSERT_EQ(snapshot.size(), records.size() * sizeof records[0]);
  snapshot.copy(reinterpret_cast<char *>(records.data()), snapshot.size());
  uint32_t second = lastSecond - 120;
  std::set<uint32_t> operations;
  for (const SnapshotRecord &record : records) {
    EXPECT_EQ(record.timestamp, ++second);
    const auto *words = reinterpret_cast<const uint32_t *>(&record);
    EXPECT_LT(*std::max_element(words + 1, words + sizeof record / 4), 1'000'000U);
    EXPECT_GE(record.nandReads, record.hostReads);
    EXPECT_GE(record.nandWrites, record.hostWrites);
    for (const auto &priorities : {record.reads, record.writes}) {
      for (const SnapshotOperations *each = priorities; each < priorities + 4; ++each) {
        EXPECT_GE(each->totalLatency, each->maxLatency);
        EXPECT_GT(each->maxLatency, 0U);
        operations.insert(each->count);
      }
    }
  }
  EXPECT_GT(operations.size(), 100U);
}

// At each time in turn: before the first power-on, two minutes after it, 100 ms apart, about a full
// hour, and when counters of 32 bits have come to their end.
TEST(SimulatedPlatformTest, MakesWhatEveryParserUnderstands) {
  setenv("GRELLON_SCENARIO", "", 1);  // as if it were unset
  const uint32_t connection = Connect("VeltoQRN3NVMeController");
  const uint64_t powerOn = 1704067200000;
  const auto notLess = [](const std::vector<uint64_t> &values,
                          const std::vector<uint64_t> &before) {
    return std::equal(values.begin(), values.end(), before.begin(), std::greater_equal());
  };
  Statistics before;
  uint64_t ageBefore = 0;
  for (const uint64_t time :
       {uint64_t{1}, powerOn + 120'000, powerOn + 120'100, powerOn + 3'599'999, powerOn + 3'600'000,
        uint64_t{8'000'000'000'000}}) {
    wallClock = static_cast<int64_t>(time);
    const uint64_t age = std::max(time, powerOn + 120'000) - powerOn;
    Statistics now = CheckStatistics(connection);
    CheckSnapshot(connection, static_cast<uint32_t>(age / 1000));
    EXPECT_EQ(now.ftl.at(9), (powerOn + age) / 1000) << "the calendar time";
    EXPECT_EQ(now.ftl.at(10), age / 3'600'000) << "the hours";
    const double angle = static_cast<double>(age % 60'000) / 60'000 * 2 * std::acos(-1);
    const uint64_t busy = age + static_cast<uint64_t>(std::llround(5000 * std::sin(angle)));
    EXPECT_EQ(now.msp.at(0), std::min<uint64_t>(900'000 + busy / 90, 4294967295));
    if (ageBefore != 0) {
      EXPECT_EQ(now.ftl != before.ftl, age > ageBefore);
      EXPECT_EQ(now.msp != before.msp, age > ageBefore);
      EXPECT_TRUE(notLess(now.ftl, before.ftl) && notLess(now.msp, before.msp));
    }
    before = std::move(now);
    ageBefore = age;
  }
  for (const char left : {'\1', '\0'}) {
    const uint32_t request[6] = {39, 1025};
    std::string reply(4, '#');
    size_t size = reply.size();
    EXPECT_EQ(CallStructMethod(connection, 9, request, sizeof request, reply.data(), &size), 0);
    EXPECT_EQ(reply[0], left) << "two units are pending";
  }
  for (const uint32_t command : {13U, 221U, 22U, 145U}) {
    const uint32_t request[6] = {command};
    std::string reply(101, '#');
    size_t size = 99;
    EXPECT_EQ(CallStructMethod(connection, 9, request, sizeof request, reply.data(), &size), 0);
    EXPECT_EQ(size, 99U);
    EXPECT_EQ(reply, Read(connection, 9, command).substr(0, 99) + "##");
  }
  for (const uint32_t command : {11U, 15U, 17U}) {
    const uint32_t request[6] = {command};
    size_t size = 99;
    EXPECT_EQ(CallStructMethod(connection, 9, request, sizeof request, nullptr, &size),
              kNotOffered);
    EXPECT_EQ(size, 0U);
  }
  CloseService(connection);
}

TEST(SimulatedPlatformTest, RefusesAndReportsBadHandles) {
  Play("[[controller]]\nclass = 'KVRStorage'\nrefuse_open = [2]\nfail_close = [2]\n");
  EXPECT_EQ(ServiceMatching(nullptr), nullptr);
  EXPECT_EQ(GetMatchingService(nullptr), 0U);
  const uint32_t service = Find();
  uint32_t connection = 0;
  uint32_t second = 1;
  size_t size = 99;
  EXPECT_EQ(OpenService(service, 0, &connection), 0);
  EXPECT_EQ(OpenService(service, 0, &second), kRefused);
  EXPECT_EQ(second, 0U);
  EXPECT_EQ(OpenService(service, 0, &second), 0);
  testing::internal::CaptureStderr();
  EXPECT_EQ(CloseService(service), kBadHandle);
  EXPECT_EQ(ReleaseObject(second + 1), kBadHandle);
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_EQ(CloseService(second), kDeviceError);
  EXPECT_EQ(CloseService(second), kBadHandle);
  EXPECT_EQ(CallStructMethod(connection, 8, nullptr, 0, nullptr, &size), kBadHandle);
  EXPECT_EQ(ReleaseObject(service), 0);
  EXPECT_EQ(OpenService(service, 0, &connection), kBadHandle);
  EXPECT_EQ(CloseService(0), kBadHandle);
  EXPECT_EQ(
      testing::internal::GetCapturedStderr(),
      "connection 1 is of another kind\nservice 4 is unknown\nconnection 3 is already released\n"
      "connection 2 is already released\nservice 1 is already released\n");
}

TEST(SimulatedPlatformTest, ReportsHandlesLeftOpenAtExit) {
  Play("[[controller]]\nclass = 'KVRStorage'\n");
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(std::exit(Find() == 1 ? 0 : 1), testing::ExitedWithCode(0),
              "service 1 of KVRStorage is still open");
}

// What the scheduler does with an activity, call by call: the state it is in, the answers to four
// questions, and which states it may be set to.
void Journal(Activity *activity) {
  const int state = GetActivityState(activity);
  std::fprintf(stderr, "state %d ", state);
  bool yield = false;
  for (int question = 0; question < 4; ++question) {
    const bool answer = ActivityShouldDefer(activity);
    std::fputc(answer ? 'y' : 'n', stderr);
    yield = yield || answer;
  }
  if (SetActivityState(activity, kActivityStateRun)) std::fputs(" set to run", stderr);
  if (yield || state != kActivityStateRun) {
    std::fputs(SetActivityState(activity, kActivityStateDefer) ? " deferred" : " not deferred",
               stderr);
  }
  std::fputs(", ", stderr);
  if (std::getenv("FORGETFUL") == nullptr) ExitTransactionClean();
}

// A scenario that cannot be read leaves a tool without controllers, and the daemon does not start.
TEST(SimulatedPlatformDeathTest, EndsForABadScenarioOnlyWhereItMay) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  setenv("GRELLON_SCENARIO", "/no/such", 1);
  const auto find = [] { return Find() + Find("VeltoQRN3NVMeController"); };
  const struct {
    void (*call)();
    int status;
  } cases[] = {{[] {}, 0},
               {[] { SystemLog("%s", "never"); }, 2},
               {[] { RegisterActivity("never", kActivityCheckIn, Journal); }, 2},
               {[] { RunMainQueue(); }, 2}};
  for (const auto &[call, status] : cases) {
    EXPECT_EXIT((call(), std::exit(static_cast<int>(find()))), testing::ExitedWithCode(status),
                "^platform_tests: /no/such: No such file or directory\n$");
    if (status == 0) continue;
    EXPECT_EXIT((find(), call()), testing::ExitedWithCode(status),
                "^platform_tests: /no/such: No such file or directory\n$");
  }
}

[[noreturn]] void PlaySchedule(const std::string &schedule) {
  Play("[schedule]\n" + schedule);
  RegisterActivity("test", kActivityCheckIn, Journal);
  RunMainQueue();
}

// Delays that are swapped would take a thousand seconds.
TEST(SimulatedSchedulerDeathTest, RunsAndResumesOnSchedule) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const std::string checkIn = "^state 0 nnnn not deferred, ";
  const struct {
    const char *schedule, *journal;
  } cases[] = {
      {"runs = 0\nfirst_run_after = 1000", "$"},
      {"runs = 3\nfirst_run_after = 0\ninterval = 0\nresume_after = 0\n"
       "defer_at_check = [3, 0, 4, 1]",
       "state 2 nnyy deferred, state 2 nnnn, state 2 nnny deferred, state 2 yyyy deferred, "
       "state 2 nnnn, state 2 nnnn, $"},
      {"first_run_after = 0\ninterval = 1000\nresume_after = 0\ndefer_at_check = [4]",
       "state 2 nnny deferred, state 2 nnnn, $"},
      {"runs = 2\nfirst_run_after = 0\ninterval = 0\nresume_after = 1000",
       "state 2 nnnn, state 2 nnnn, $"},
  };
  for (const auto &[schedule, journal] : cases) {
    EXPECT_EXIT(PlaySchedule(schedule), testing::ExitedWithCode(0), checkIn + journal) << schedule;
  }
  EXPECT_EXIT((Play("schedule.first_run_after = 1000"), RunMainQueue()), testing::ExitedWithCode(0),
              "^$")
      << "no activity";
  setenv("FORGETFUL", "", 1);
  EXPECT_EXIT(PlaySchedule("first_run_after = 0"), testing::ExitedWithCode(0),
              checkIn + "state 2 nnnn, the run did not end its transaction\n$");
  unsetenv("FORGETFUL");
}

TEST(SimulatedSchedulerDeathTest, WaitsASecondBeforeRunsAndTwoBeforeResuming) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const auto elapsed = [](const std::string &schedule) {
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EXIT(PlaySchedule(schedule), testing::ExitedWithCode(0), "");
    return std::lround(
        std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
  };
  EXPECT_EQ(elapsed("interval = 0\nresume_after = 0"), 1);
  EXPECT_EQ(elapsed("runs = 2\nfirst_run_after = 0"), 1);
  EXPECT_EQ(elapsed("first_run_after = 0\ndefer_at_check = [1]"), 2);
}

TEST(SimulatedSchedulerDeathTest, WaitsFractionsOfSeconds) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  for (const char *delay : {"first_run_after", "interval", "resume_after"}) {
    std::string schedule = "runs = 2\ndefer_at_check = [1]\n";
    for (const char *each : {"first_run_after", "interval", "resume_after"}) {
      schedule += std::string(each) + (each == delay ? " = 0.25\n" : " = 0\n");
    }
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EXIT(PlaySchedule(schedule), testing::ExitedWithCode(0), "");
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(250)) << delay;
  }
}

}  // namespace
