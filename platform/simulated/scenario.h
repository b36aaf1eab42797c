// What the simulated platform plays: its controllers, its schedule, its log.
#ifndef PLATFORM_SIMULATED_SCENARIO_H
#define PLATFORM_SIMULATED_SCENARIO_H

#include <chrono>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace simulated {

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
  Fault failClose;
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

// The driver method that takes task-scheduler requests for the class, or 0 for an unknown class.
uint32_t TaskSchedulerMethod(std::string_view className);

// Parses the text of a scenario file. On failure returns false with "FILE:LINE: reason" in `error`.
bool ParseScenario(std::string_view text, const std::string &file, Scenario *scenario,
                   std::string *error);

// The scenario of this process, loaded at the first call: the file that GRELLON_SCENARIO names, or
// the built-in one. A bad file is one line on standard error and ends the process with status 2.
const Scenario &TheScenario();

}  // namespace simulated

#endif
