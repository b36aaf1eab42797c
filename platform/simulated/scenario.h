// What the simulated platform plays: its controllers, its schedule, its log.
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

// What a request asks for: its first number. The simulated drivers have their own copy of all such
// numbers, and of the classes and their methods, so that a wrong one in the library is noticed.
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

// The buffers that are read from a controller, and the scenario's keys for them.
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

// Which calls of one kind go wrong: all of them, or those with the listed numbers, counted from 1.
struct Fault {
  bool always = false;
  std::vector<uint32_t> calls;

  bool Hits(uint32_t call) const;
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
  std::map<uint32_t, std::vector<std::string>>
      files;  // by command: what its reads hand out in turn
};

struct Schedule {
  uint32_t runs = 1;  // a run that resumes a deferred one is not counted
  std::chrono::milliseconds firstRunAfter{1000};
  std::chrono::milliseconds interval{1000};
  std::chrono::milliseconds resumeAfter{2000};
  // For each run, resumed ones included: the question from which on it is asked to yield; 0 never.
  std::vector<uint32_t> deferAtCheck;
};

struct Scenario {
  std::vector<Controller> controllers;
  Schedule schedule;
  bool logEnabled = true;
};

// The driver method that takes the requests for a controller of the class; 0 for an unknown class.
uint32_t RequestMethod(std::string_view className);

// Parses the text of a scenario file; the files it names are relative to that file. Nothing for a
// bad one, with "FILE:LINE: reason" in `error`. Opens nothing.
std::optional<Scenario> ParseScenario(std::string_view text, const std::string &file,
                                      std::string *error);

// The scenario of this process, loaded at the first call: the file that GRELLON_SCENARIO names, or
// the built-in one. Null for a bad file, about which there is one line on standard error.
const Scenario *TheScenario();

}  // namespace simulated

#endif
