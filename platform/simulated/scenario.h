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

// The buffers of a controller: their keys in a scenario, and the first number of a request for
// each. The simulated drivers have their own copies of these numbers, and of the classes and
// methods, so that tests notice a wrong one in the library.
struct Buffer {
  std::string_view key;
  uint32_t command;
};
inline constexpr std::array<Buffer, 7> kBuffers = {{
    {"statistics", 13},
    {"msp", 221},
    {"snapshot", 22},
    {"snapshot_header", 145},
    {"band", 11},
    {"defects", 15},
    {"telemetry", 17},
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
  Fault vanish;          // searches that find nothing
  Fault refuseOpen;
  Fault failRequest;
  Fault failRead;
  Fault shortRead;
  Fault failClose;
  // By key of a buffer: the files that its reads return, one after the other.
  std::map<std::string_view, std::vector<std::string>> files;
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

// Parses the text of a scenario file; file names in it are relative to the folder of `file`. For a
// bad text returns nothing, with "FILE:LINE: reason" in `error`. Opens no file.
std::optional<Scenario> ParseScenario(std::string_view text, const std::string &file,
                                      std::string *error);

// The scenario of this process: the file that GRELLON_SCENARIO names, or the built-in one. The
// first call loads it. Null for a bad file, after one line on standard error.
const Scenario *TheScenario();

}  // namespace simulated

#endif
