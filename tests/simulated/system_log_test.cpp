// The system log of the simulated platform: its lines, and what becomes of them when nobody reads.

#include <fcntl.h>
#include <poll.h>
#include <pty.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <sys/un.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <ctime>
#include <regex>
#include <sstream>
#include <vector>

#include "tests/simulated/platform.h"

namespace {

std::string systemLog;  // what sendto, below, was given
volatile int systemLogError = 0;

// What each line says after the name of the daemon.
std::vector<std::string> Texts(const std::string &log) {
  std::vector<std::string> texts;
  std::istringstream lines(log);
  for (std::string line; std::getline(lines, line);) {
    if (line.ends_with('\r')) line.pop_back();  // at a terminal
    texts.push_back(line.substr(std::min(line.size(), line.find(": ") + 2)));
  }
  return texts;
}

TEST(SimulatedSystemLogTest, LogsToTheSystemAndToThePersonAtTheTerminal) {
  Play("");
  setenv("TZ", "FAR-11:30", 1);
  const time_t now = std::time(nullptr) + 41'400;  // 11:30 hours
  char hour[16];
  std::strftime(hour, sizeof hour, "%b %e %H:", std::gmtime(&now));
  testing::internal::CaptureStderr();
  for (const char *text : {"100%", "line\n", ""}) SystemLog("%s", text);
  SystemLog("%01100d", 7);
  const std::string cut(1023, '0');
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "grellon: 100%\ngrellon: line\ngrellon: \ngrellon: " + cut + "\n");
  EXPECT_EQ(Texts(systemLog), (std::vector<std::string>{"100%", "line", "", cut}));
  // Facility daemon, level notice, local time.
  const std::string begin = std::string("<29>") + hour + "[0-5][0-9]:[0-6][0-9] ";
  const std::string each = begin + "grellon\\[" + std::to_string(getpid()) + "\\]: .*\n";
  EXPECT_TRUE(std::regex_match(systemLog, std::regex(each + each + each + each))) << systemLog;
}

// The system's log goes away again while the line waits that says how many were dropped before.
// Each line is shorter than the one before, whose place it may take.
TEST(SimulatedSystemLogTest, CountsAgainWhatALostCountSaid) {
  Play("");
  alarm(20);  // in case it never ends
  int width = 8;
  for (const int error : {ECONNREFUSED, ECONNREFUSED, EAGAIN, ECONNREFUSED, EAGAIN, 0, EAGAIN, 0}) {
    systemLogError = error;
    SystemLog("error %0*d", width--, error);
  }
  // The first four lines are lost: the third waits, with the count of the first two, until the
  // fourth finds no log. The fifth and the seventh wait for the next and are not lost.
  EXPECT_EQ(Texts(systemLog),
            (std::vector<std::string>{"4 lines of the log were dropped", "error 0011", "error 000",
                                      "error 11", "error 0"}));
}

// A line takes 29 characters in the log, with its NUL. The room for lines that wait is 16 KiB;
// after 564 lines it is one character too small for another.
constexpr char kLine[] = "line %013u";
constexpr unsigned long kWaiting = 564;

// The log has all lines in order, except for one gap. A line says how many are missing; at least
// `least` lines stand before it.
void CheckOneGap(const std::string &log, unsigned long lines, unsigned long least) {
  unsigned long next = 1;
  int gaps = 0;
  for (const std::string &text : Texts(log)) {
    if (text.starts_with("line ")) {
      EXPECT_TRUE(text.size() == 18 && std::stoul(text.substr(5)) == next++) << text;
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

// Each opens what standard error may be, and stores the reader's end and the writer's.
constexpr int (*kOpen[])(int *ends) = {
    pipe, [](int *ends) { return socketpair(AF_UNIX, SOCK_STREAM, 0, ends); },
    [](int *ends) { return openpty(&ends[0], &ends[1], nullptr, nullptr, nullptr); }};

using FullLogTest = testing::TestWithParam<int>;
INSTANTIATE_TEST_SUITE_P(PipeSocketTerminal, FullLogTest, testing::Range(0, 3));

// Nobody reads standard error or the system's log. Then standard error is read piece by piece, and
// the system's log goes away and comes back.
TEST_P(FullLogTest, NeverWaits) {
  int ends[2] = {};
  ASSERT_EQ(kOpen[GetParam()](ends), 0);
  const auto [reader, writer] = ends;
  Play("[[controller]]\nclass = 'KVRStorage'\nstatistics = '/none'\n");
  fcntl(reader, F_SETFL, O_NONBLOCK);
  const int standardError = dup(STDERR_FILENO);
  dup2(writer, STDERR_FILENO);
  std::string log;
  systemLogError = EAGAIN;
  alarm(20);  // in case it waits
  unsigned line = 0;
  // A terminal has room once more, after the kernel has moved what was written.
  pollfd room = {.fd = STDERR_FILENO, .events = POLLOUT, .revents = 0};
  while (line < 20'000 || poll(&room, 1, 50) > 0) SystemLog(kLine, ++line);
  // A complaint is given up, too.
  const uint32_t request[6] = {13};
  char reply[4];
  size_t size = sizeof reply;
  EXPECT_EQ(CallStructMethod(Connect(), 8, request, sizeof request, reply, &size), kDeviceError);
  // A terminal's line end is longer.
  const unsigned lineSize = isatty(STDERR_FILENO) != 0 ? 29 : 28;
  int unread = 0;
  ioctl(reader, FIONREAD, &unread);
  systemLogError = ECONNREFUSED;
  SystemLog(kLine, ++line);
  systemLogError = 0;
  // A terminal hands a line on some time after it was written.
  pollfd more = {.fd = reader, .events = POLLIN, .revents = 0};
  for (const unsigned last = line + 99; line < last || poll(&more, 1, 200) > 0;) {
    if (line < last) SystemLog(kLine, ++line);
    char some[5000];
    const ssize_t count = read(reader, some, sizeof some);
    if (count > 0) log.append(some, static_cast<size_t>(count));
    usleep(1000);
  }
  alarm(0);
  EXPECT_EQ(fcntl(STDERR_FILENO, F_GETFL) & O_NONBLOCK, 0) << "others write there too";
  dup2(standardError, STDERR_FILENO);
  CheckOneGap(log, line, static_cast<unsigned>(unread) / lineSize + kWaiting);
  CheckOneGap(systemLog, line, 0);  // the lines that waited were dropped when there was no log
}

// The system's log is full: a line waits there that says that the first one was lost. Standard
// error is a pipe that is too small for all lines. A quarter of a second after the end a child
// reads it, up to the last line; only then the system's log takes lines again.
[[noreturn]] void EndWhileBothAreFull() {
  Play("");
  static const int standardError = dup(STDERR_FILENO);
  // NOLINTNEXTLINE(cert-env33-c): the command is a constant
  static FILE *reader = popen("sleep .25; timeout 9 sed -n '2600{p;q}' >&2; kill -ALRM $PPID", "w");
  dup2(fileno(reader), STDERR_FILENO);
  std::signal(SIGALRM, [](int) { systemLogError = 0; });
  std::atexit([] {  // after the log's own end
    dup2(standardError, STDERR_FILENO);
    pclose(reader);
    std::fputs(systemLog.c_str(), stderr);
  });
  systemLogError = ECONNREFUSED;
  SystemLog(kLine, 1U);
  systemLogError = EAGAIN;
  for (unsigned line = 2; line <= 2600; ++line) SystemLog(kLine, line);
  std::exit(0);
}

TEST(SimulatedSystemLogDeathTest, GivesWhatWaitsSomeTimeAtTheEnd) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(EndWhileBothAreFull(), kEndsWell,
              "line 0000000002600\n<29>[^\n]*: 1 lines of the log were dropped\n<29>.*: line "
              "0000000000002\n.*: [0-9]+ lines of the log were dropped\n$");
}

}  // namespace

// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name): the C library's are reserved
// Takes the place of the system's log.
extern "C" MORWICK_EXPORT ssize_t sendto(int, const void *text, size_t size, int flags,
                                         const sockaddr *log, socklen_t) {
  EXPECT_STREQ(reinterpret_cast<const sockaddr_un *>(log)->sun_path, "/dev/log");
  EXPECT_NE(flags & MSG_DONTWAIT, 0);
  errno = systemLogError;
  if (errno != 0) return -1;
  systemLog.append(static_cast<const char *>(text), size).push_back('\n');
  return static_cast<ssize_t>(size);
}
// NOLINTEND(readability-inconsistent-declaration-parameter-name)
