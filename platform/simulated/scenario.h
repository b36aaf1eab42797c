// A scenario tells the simulated platform which controllers, which schedule and which log to play.
#ifndef PLATFORM_SIMULATED_SCENARIO_H
#define PLATFORM_SIMULATED_SCENARIO_H

#include <array>
#include <chrono>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace simulated {

// The first number of a request. The simulated drivers have their own copies of these numbers, and
// of the classes and methods, so that tests notice a wrong one in the library.
enum Command : uint32_t {
  kReadBand = 11,
  kReadStatistics = 13,
  kReadDefects = 15,
  kReadTelemetry = 17,
  kReadSnapshot = 22,
  kTaskScheduler = 39,
  kReadSnapshotHeader = 145,
  kReadMsp = 221,
};

// The buffers of a controller, and their keys in a scenario.
struct Buffer {
  std::string_view key;
  Command command;
};
inline constexpr std::array<Buffer, 7> kBuffers = {{
    {"statistics", kReadStatistics},
    {"msp", kReadMsp},
    {"snapshot", kReadSnapshot},
    {"snapshot_header", kReadSnapshotHeader},
    {"band", kReadBand},
    {"defects", kReadDefects},
    {"telemetry", kReadTelemetry},
}};

// Which calls of one kind fail: all of them, or those with the listed numbers, counted from 1.
struct Fault {
  bool always = false;
  std::vector<uint32_t> calls;
  uint32_t count = 0;  // of calls so far

  // Counts a call. True when it fails.
  bool Hits();
};

struct Controller {
  std::string className;
  uint32_t pending = 2;  // units of BDR work
  Fault vanish;          // look-ups that find nothing
  Fault refuseOpen;
  Fault failRequest;
  Fault failRead;
  Fault shortRead;
  Fault failClose;
  // By command: the files that its reads return, one after the other.
  std::map<uint32_t, std::vector<std::string>> files;
};

struct Schedule {
  uint32_t runs = 1;  // without the runs that resume a deferred one
  std::chrono::milliseconds firstRunAfter{1000};
  std::chrono::milliseconds interval{1000};
  std::chrono::milliseconds resumeAfter{2000};
  // For each run, resumed runs too: from which check on it is asked to yield; 0 for never.
  std::vector<uint32_t> deferAtCheck;
};

struct Scenario {
  std::vector<Controller> controllers;
  Schedule schedule;
  bool logEnabled = true;
};

// The driver method that takes the requests for a controller of the class; 0 for an unknown class.
uint32_t RequestMethod(std::string_view className);

// Parses the text of a scenario file. Names of files in it are relative to that file. For a bad
// text returns nothing, with "FILE:LINE: reason" in `error`. Opens no file.
std::optional<Scenario> ParseScenario(std::string_view text, const std::string &file,
                                      std::string *error);

// The scenario of this process: the file that GRELLON_SCENARIO names, or the built-in one. The
// first call loads it. Null for a bad file, after one line on standard error.
const Scenario *TheScenario();

}  // namespace simulated

#endif
