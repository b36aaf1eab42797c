// The daemon as a process: scenarios, signals, log and exit status.

#include <gtest/gtest.h>
#include <signal.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <thread>

#include "tests/process.h"

namespace {

using std::chrono::seconds;
using std::chrono::steady_clock;

const std::string kNVMe = "[[controller]]\nclass = 'VeltoQRN3NVMeController'\n";
const std::string kQuick = "[schedule]\nfirst_run_after = 0\nresume_after = 0\ninterval = 0\n";

std::string Scenario(const std::string &text) {
  return "GRELLON_SCENARIO=" + TemporaryFile("scenario.toml", text);
}

// The places of the texts in `log`, in this order, or the first one that is not there.
void ExpectInOrder(const std::string &log, const std::vector<std::string> &texts) {
  size_t position = 0;
  for (const std::string &text : texts) {
    position = log.find(text, position);
    ASSERT_NE(position, std::string::npos) << "'" << text << "' is missing or out of order in\n"
                                           << log;
    position += text.size();
  }
}

TEST(DaemonTest, PlaysTheScenariosItComesWith) {
  const std::string found = "Morwick: findNandExporter: Controller found: ";
  const struct {
    const char *file;
    std::string out;
    std::vector<std::string> log;
  } cases[] = {
      {"finishes.toml",
       found + "VeltoQRN3NVMeController\n",
       {"start grellon", "is BDR done: NO (2)", "6/6 - sleeping", "is BDR done: NO (1)",
        "is BDR done: YES (0)", "iter# 3 - DONE - no more BDR", "stopping grellon daemon"}},
      {"defers.toml",
       found + "KVRStorage\n" + found + "KVRStorage\n",
       {"defer chck 3/6 - deferring!!!!", "closing io service connection", "deferring grellon",
        "running grellon", "iter# 1 - KVR status pass - is BDR done: YES (0)", "stopping"}},
      {"refuses.toml",
       found + "VeltoQRN3NVMeController\n" + found + "VeltoEmbeddedNVMeController\n",
       {"running grellon", "stopping grellon", "running grellon", "opened io service", "stopping"}},
      {"fails.toml",
       found + "VeltoEmbeddedNVMeController\n",
       {"iter# 2 - KVR status fail", "iter# 2 - DONE - no more BDR", "closing io service",
        "error closing connection to service", "stopping grellon daemon"}},
      {"empty.toml", "", {"running grellon", "stopping grellon daemon"}},
  };
  for (const auto &[file, out, log] : cases) {
    SCOPED_TRACE(file);
    const ProcessResult result =
        RunProcess({GRELLON}, FastSleep({"GRELLON_SCENARIO=" SCENARIOS "/" + std::string(file)}));
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.out, out);
    ExpectInOrder(result.err, log);
    EXPECT_EQ(result.err.find("still open"), std::string::npos) << result.err;
  }
}

TEST(DaemonTest, RefusesABadScenarioInOneLine) {
  const struct {
    std::string text;
    std::string reason;
  } cases[] = {
      {"\n[schedule\n", ":2: Error while parsing table header: expected ']', saw '\\n'"},
      {"[schedule]\nrunz = 1\n", ":2: unknown key 'runz'"},
      {"log.level = 3\n", ":1: unknown key 'level'"},
      {"x = 1\n", ":1: unknown key 'x'"},
      {"[schedule]\nruns = 'two'\n", ":2: 'runs' must be a whole number"},
      {"[schedule]\nruns = 1.5\n", ":2: 'runs' must be a whole number"},
      {"[schedule]\nruns = -1\n", ":2: 'runs' must be between 0 and 4294967295"},
      {"[schedule]\ninterval = -0.1\n", ":2: 'interval' must be between 0 and 1000000 seconds"},
      {"[schedule]\ninterval = nan\n", ":2: 'interval' must be between 0 and 1000000 seconds"},
      {"[schedule]\ndefer_at_check = [1,\n -2]\n",
       ":3: 'defer_at_check' must be between 0 and 4294967295"},
      {"schedule = 1\n", ":1: 'schedule' must be a table"},
      {"log.enabled = 1\n", ":1: 'enabled' must be true or false"},
      {"controller = 1\n", ":1: 'controller' must be [[controller]]"},
      {"controller = [1]\n", ":1: a controller must be a table"},
      {"[[controller]]\npending = 1\n", ":1: 'class' is missing"},
      {"[[controller]]\nclass = 1\n", ":2: 'class' must be text"},
      {"[[controller]]\nclass = 'Other'\n", ":2: unknown controller class 'Other'"},
      {kNVMe + kNVMe, ":3: a second controller of class 'VeltoQRN3NVMeController'"},
      {kNVMe + "pending = 4294967296\n", ":3: 'pending' must be between 0 and 4294967295"},
      {kNVMe + "fail_request = 1\n",
       ":3: 'fail_request' must be true, false or a list of call numbers"},
      {kNVMe + "fail_close = [0]\n", ":3: 'fail_close' must be between 1 and 4294967295"},
  };
  for (const auto &[text, reason] : cases) {
    SCOPED_TRACE(text);
    const std::string file = TemporaryFile("bad.toml", text);
    const ProcessResult result = RunProcess({GRELLON}, {"GRELLON_SCENARIO=" + file});
    EXPECT_EQ(result.status, 2);
    EXPECT_EQ(result.err, "grellon: " + file + reason + "\n");
  }
  for (const auto &[file, reason] :
       std::map<std::string, std::string>{{"/no/such", ": No such file or directory\n"},
                                          {"/tmp", ": Is a directory\n"},
                                          {"/dev/zero", ": larger than a mebibyte\n"}}) {
    const ProcessResult result = RunProcess({GRELLON}, {"GRELLON_SCENARIO=" + file});
    EXPECT_EQ(result.status, 2);
    EXPECT_EQ(result.err, "grellon: " + file + reason);
  }
}

TEST(DaemonTest, StopsOnSIGTERMDuringAPause) {
  Process daemon({GRELLON}, {Scenario(kQuick + kNVMe + "pending = 9\n")});
  ASSERT_TRUE(daemon.WaitForError("sleeping for 5s"));
  daemon.Signal(SIGTERM);
  const auto start = steady_clock::now();
  const ProcessResult result = daemon.Wait();
  EXPECT_LT(steady_clock::now() - start, seconds(6));
  EXPECT_EQ(result.status, 0);
  ExpectInOrder(result.err, {"chck 2/6 - deferring!!!!", "closing io service connection",
                             "deferring grellon daemon"});
  EXPECT_EQ(result.err.find("still open"), std::string::npos);
}

TEST(DaemonTest, DefersOnSIGUSR1AndResumesTheRemainingWork) {
  Process daemon({GRELLON}, {Scenario(kQuick + kNVMe + "pending = 2\n")});
  ASSERT_TRUE(daemon.WaitForError("sleeping for 5s"));
  daemon.Signal(SIGUSR1);
  const ProcessResult result = daemon.Wait();
  EXPECT_EQ(result.status, 0);
  ExpectInOrder(result.err, {"NO (1)", "chck 2/6 - deferring!!!!", "deferring grellon daemon",
                             "running grellon", "YES (0)", "stopping grellon daemon"});
}

// The sum over all threads: a thread that polls gives its processor up again and again.
long ContextSwitches(pid_t pid) {
  long sum = 0;
  for (const auto &task :
       std::filesystem::directory_iterator("/proc/" + std::to_string(pid) + "/task")) {
    std::ifstream status(task.path() / "status");
    for (std::string word; status >> word;) {
      long count = 0;
      if (word == "voluntary_ctxt_switches:" && status >> count) sum += count;
    }
  }
  return sum;
}

TEST(DaemonTest, WaitsForTheNextRunWithoutPolling) {
  Process daemon({GRELLON}, {Scenario("schedule.first_run_after = 1000\n")});
  ASSERT_TRUE(daemon.WaitForError("start grellon"));
  std::this_thread::sleep_for(std::chrono::milliseconds(500));
  const long before = ContextSwitches(daemon.pid());
  std::this_thread::sleep_for(seconds(1));
  EXPECT_GT(before, 0);
  EXPECT_EQ(ContextSwitches(daemon.pid()), before);
  daemon.Signal(SIGUSR1);  // no run to yield: nothing happens
  daemon.Signal(SIGINT);
  const ProcessResult result = daemon.Wait();
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.err, "grellon: start grellon\n");
}

TEST(DaemonTest, WritesNothingWhenTheLogIsMasked) {
  const ProcessResult result =
      RunProcess({GRELLON}, {Scenario("log.enabled = false\n" + kQuick + kNVMe + "pending = 1\n")});
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.err, "");
}

}  // namespace
