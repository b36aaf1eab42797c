// morwick watch: what changes between successive readings of a controller.

#include <algorithm>
#include <array>
#include <chrono>
#include <csignal>
#include <ctime>
#include <memory>
#include <new>

#include "tools/changes.h"
#include "tools/commands.h"
#include "tools/options.h"
#include "tools/text.h"

namespace tools {
namespace {

using SteadyClock = std::chrono::steady_clock;
using std::chrono::system_clock;

struct Options {
  std::string stream;
  std::string className;
  std::string format;
  double every = 5;
  uint64_t count = UINT64_MAX;  // of readings after the first
  bool all = false;
};

// One reading of the controller, good or not.
struct Reading {
  system_clock::time_point time = system_clock::now();
  SteadyClock::time_point moment = SteadyClock::now();
  Dump dump;
  std::optional<Statistics> statistics;  // there are none without a dump

  Reading(const std::string &stream, const std::string &className) {
    try {
      dump = ReadDumpLive(stream, className);
      if (dump.status == kGood) statistics.emplace(dump, stream);
    } catch (const std::bad_alloc &) {
      Complain(stream, "out of memory");
      dump.status = kBadData;
    }
  }

  // The status of the reading, after complaints. Statistics that took all memory are given up.
  Status Judge() {
    if (!statistics) return dump.status;
    const Status status = statistics->Judge(dump);
    if (statistics->outOfMemory()) statistics.reset();
    return status;
  }
};

// Signals that end the watch are taken where it waits, so that a reading is always whole; a second
// one of them ends a reading that hangs. The end of the terminal stays ignored where it was (by
// nohup); an interrupt does not: a shell has it ignored by whatever it starts in the background.
class StopSignals {
 public:
  StopSignals() {
    struct sigaction action = {};
    action.sa_handler = [](int) { stopped_ = 1; };
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    sigemptyset(&signals_);
    for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
      struct sigaction before = {};
      sigaction(signal, nullptr, &before);
      if (signal == SIGHUP && before.sa_handler == SIG_IGN) continue;
      sigaction(signal, &action, nullptr);
      sigaddset(&signals_, signal);
    }
  }

  // False when the watch is to end, for a signal or because nobody reads it any more.
  bool WaitUntil(SteadyClock::time_point moment, Output &output) {
    sigset_t before;
    sigprocmask(SIG_BLOCK, &signals_, &before);  // none is missed between question and sleep
    bool reader = true;
    int64_t left = 1;  // nanoseconds; without any, signals and reader are asked for all the same
    while (stopped_ == 0 && reader && left > 0) {
      left = std::max(std::chrono::nanoseconds(moment - SteadyClock::now()).count(), int64_t{0});
      reader = output.WaitWithReader({left / 1000000000, left % 1000000000}, before);
    }
    sigprocmask(SIG_SETMASK, &before, nullptr);
    return stopped_ == 0 && reader;
  }

 private:
  static volatile sig_atomic_t stopped_;
  sigset_t signals_;
};

volatile sig_atomic_t StopSignals::stopped_ = 0;

// Since the epoch.
std::string Seconds(system_clock::time_point time) {
  return ThreeDecimals(std::chrono::duration<double>(time.time_since_epoch()).count());
}

std::string LocalTime(system_clock::time_point time) {
  const std::time_t seconds = system_clock::to_time_t(time);
  std::tm local = {};
  localtime_r(&seconds, &local);
  std::array<char, 64> text;
  std::strftime(text.data(), text.size(), "%F %T", &local);
  return text.data();
}

void PrintCsv(Output &output, const Reading &now, const std::vector<Change> &changes,
              double seconds) {
  const std::string time = Seconds(now.time);
  for (const Change &change : changes) {
    const std::optional<double> rate = change.Rate(seconds);
    output.Write(time + "," + std::string(change.name) + "," +
                 (change.now == nullptr ? "" : change.now->text) + "," + change.Difference() + "," +
                 (rate ? ThreeDecimals(*rate) : "") + "\n");
  }
}

// Prints what changed since the last good reading, if there was one; returns the status of both.
Status PrintBlock(Output &output, const Options &options, const Reading *old, const Reading &now,
                  Status status) {
  std::vector<Change> changes;
  std::optional<double> seconds;
  if (old != nullptr && now.statistics) {
    if (auto found =
            FindChanges(*old->statistics, *now.statistics, options.all, now.dump.subject)) {
      changes = std::move(*found);
      seconds = std::chrono::duration<double>(now.moment - old->moment).count();
    } else {
      status = kBadData;
    }
  }
  if (options.format == "json") {
    Json json(output, "watch", {now.dump.source});
    json.Member("stream", options.stream);
    json.Key("time");
    json.Digits(Seconds(now.time));
    PrintChanges(json, changes, seconds);
    status = json.Finish(status);
  } else if (seconds && options.format == "csv") {
    PrintCsv(output, now, changes, *seconds);
  } else if (seconds) {
    output.Write(LocalTime(now.time) + ", " + ThreeDecimals(*seconds) + " s\n");
    PrintChanges(output, changes, seconds);
    output.Write("\n");
  }
  return status;
}

Status Watch(Options options) {
  StopSignals signals;
  Output output;
  Status worst = kGood;
  std::unique_ptr<Reading> last;  // that was good
  if (options.format == "csv") output.Write("time,name,value,difference,rate\n");
  const auto every = std::chrono::duration_cast<SteadyClock::duration>(
      std::chrono::duration<double>(options.every));
  auto next = SteadyClock::now();
  for (uint64_t count = 0;; ++count) {
    auto reading = std::make_unique<Reading>(options.stream, options.className);
    // Later readings are of the same controller, and need not say again that it was found.
    if (reading->statistics) options.className = reading->dump.source.name;
    worst = std::max(worst, PrintBlock(output, options, last.get(), *reading, reading->Judge()));
    ForgetMessages();  // a watch may go on for ever
    if (reading->statistics) last = std::move(reading);
    next = std::max(next + every, SteadyClock::now());
    if (!output.Flush() || count == options.count || !signals.WaitUntil(next, output)) break;
  }
  return output.Finish(worst);
}

}  // namespace

void AddWatch(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("watch", "Print what changes between readings of a controller");
  const auto options = std::make_shared<Options>();
  AddStream(command, &options->stream);
  AddSeconds(command, "--every", &options->every, "From one reading to the next (5)");
  AddNumber(command, "--count", &options->count, UINT32_MAX,
            "Readings after the first; without it, until Ctrl-C");
  command->add_flag("--all", options->all, "List also what did not change");
  AddController(command, &options->className, "Read from this one instead of the first");
  AddFormat(command, &options->format, {"normal", "json", "csv"});
  command->callback([=] { *action = [=] { return Watch(*options); }; });
}

}  // namespace tools
