// morwick watch: prints what changes between readings of a controller.

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <algorithm>
#include <chrono>
#include <ctime>
#include <memory>
#include <new>

#include "tools/changes.h"
#include "tools/commands.h"
#include "tools/options.h"
#include "tools/stop_signals.h"
#include "tools/text.h"

namespace tools {
namespace {

using std::chrono::steady_clock;
using std::chrono::system_clock;

struct Options : StreamOptions {
  double every = 5;             // seconds
  uint64_t count = UINT64_MAX;  // of readings after the first
  bool all = false;
  bool redraw = true;
};

// One reading of the controller, good or not.
struct Reading {
  system_clock::time_point time = system_clock::now();
  steady_clock::time_point moment = steady_clock::now();
  Dump dump;
  std::optional<Statistics> statistics;  // none without a dump

  explicit Reading(const Options &options) {
    try {
      dump = ReadDumpLive(options.stream, options.className);
      if (dump.bytes) statistics.emplace(dump, options.stream, options.filter);
    } catch (const std::bad_alloc &) {
      Complain(std::string(fleet::NameOf(options.stream)), "out of memory");
      dump.status = kBadData;
    }
  }

  // Complains of what is wrong, and returns the status. Statistics that used up all memory are
  // freed.
  Status Check() {
    if (!statistics) return dump.status;
    const Status status = statistics->Check(dump);
    if (statistics->outOfMemory()) statistics.reset();
    return status;
  }
};

// Seconds since 1970.
std::string Seconds(system_clock::time_point time) {
  return ThreeDecimals(std::chrono::duration<double>(time.time_since_epoch()).count());
}

void PrintCsv(Output &output, const Reading &now, const std::vector<Change> &changes,
              double seconds) {
  const std::string time = Seconds(now.time);
  for (const Change &change : changes) {
    const std::vector<std::string> cells = change.Cells(seconds);
    output.Write(fmt::format("{},{},{},{},{}\n", time, cells[0], cells[2], cells[3], cells[4]));
  }
}

// Lines on a terminal that are drawn again and again in the same place. No mode of the terminal
// changes, so nothing must be restored when the process ends.
class RedrawnBlock {
 public:
  explicit RedrawnBlock(Output &output) : output_(output) {}

  // Draws the lines over the last ones, cut to the size of the window. When a message was printed
  // in between, it stays, and the lines begin below it.
  void Draw(std::vector<std::string> lines) {
    lines_ = std::move(lines);
    DrawAgain();
  }

  // Draws the last lines again, because the size of the window has changed.
  void DrawAgain() {
    const auto [rows, columns] = Output::Window();
    // After a resize, a line that is wider than the window takes several of its rows.
    size_t up = 0;
    for (const size_t length : drawn_) up += length == 0 ? 1 : (length + columns - 1) / columns;
    if (printed_ == LinesPrinted() && up > 0) {
      output_.Control(fmt::format("\r\033[{}A\033[J", std::min(up, rows - 1)));
    }
    printed_ = LinesPrinted();
    drawn_.clear();
    const size_t most = rows - 1;  // the cursor needs the last row
    for (size_t i = 0; i < std::min(lines_.size(), most); ++i) {
      const bool cut = i + 1 == most && lines_.size() > most;
      const std::string line =
          cut ? fmt::format("... and {} lines more", lines_.size() - i) : lines_[i];
      drawn_.push_back(std::min(line.size(), columns));
      output_.Write(line.substr(0, columns));
      output_.Write("\n");
    }
    output_.Flush();
  }

  // The next lines go below what is on the screen: another program has written there.
  void Forget() { drawn_.clear(); }

 private:
  Output &output_;
  std::vector<std::string> lines_;
  std::vector<size_t> drawn_;  // the length of each line on the screen
  uint64_t printed_ = 0;       // LinesPrinted() at the last drawing
};

// Reads again and again, and prints what changed since the last good reading.
class Watcher {
 public:
  explicit Watcher(const Options &options) : options_(options) {
    redraws_ = options.redraw && options.format == Format::kNormal && OutputIsTerminal();
    if (options.format == Format::kCsv) output_.Write("time,name,value,difference,rate\n");
  }

  // Reads once. False when writing has failed.
  bool Read() {
    auto reading = std::make_unique<Reading>(options_);
    // Later readings are of the same controller. A search by class does not print that it was
    // found.
    if (reading->statistics) options_.className = reading->dump.source.name;
    const Status status = reading->Check();
    worst_ = std::max(worst_, Print(*reading, status));
    if (reading->statistics) last_ = std::move(reading);
    return output_.Flush();
  }

  // Waits. False when the watch must end.
  bool WaitUntil(steady_clock::time_point moment) {
    for (;;) {
      const StopSignals::End end = signals_.WaitUntil(moment, output_);
      switch (end) {
        case StopSignals::End::kTime: return true;
        case StopSignals::End::kStopped: return false;
        case StopSignals::End::kContinued: block_.Forget(); [[fallthrough]];
        case StopSignals::End::kResized: break;
      }
      if (redraws_) block_.DrawAgain();
    }
  }

  Status Finish() { return output_.Finish(worst_); }

 private:
  // Prints one reading. Returns the worse status of the reading and of the comparison.
  Status Print(const Reading &now, Status status) {
    std::vector<Change> changes;
    std::optional<double> seconds;
    if (last_ != nullptr && now.statistics) {
      if (auto found =
              FindChanges(*last_->statistics, *now.statistics, options_.all, now.dump.subject)) {
        changes = std::move(*found);
        seconds = std::chrono::duration<double>(now.moment - last_->moment).count();
      } else {
        status = kBadData;
      }
    }
    switch (options_.format) {
      case Format::kJson: return PrintJson(now, changes, seconds, status);
      case Format::kCsv:
        if (seconds) PrintCsv(output_, now, changes, *seconds);
        break;
      case Format::kNormal:
        if (seconds) PrintBlock(now, changes, *seconds);
        break;
    }
    return status;
  }

  Status PrintJson(const Reading &now, const std::vector<Change> &changes,
                   std::optional<double> seconds, Status status) {
    Json json(output_, "watch", {now.dump.source});
    json.Member("stream", fleet::NameOf(options_.stream));
    json.Key("time");
    json.Digits(Seconds(now.time));
    tools::PrintChanges(json, changes, seconds);
    return json.Finish(status);
  }

  void PrintBlock(const Reading &now, const std::vector<Change> &changes, double seconds) {
    std::vector<std::string> lines = TableOf(changes, seconds);
    const std::tm time = fmt::localtime(system_clock::to_time_t(now.time));
    lines.insert(lines.begin(), fmt::format("{:%F %T}, {} s", time, ThreeDecimals(seconds)));
    if (redraws_) return block_.Draw(std::move(lines));
    for (const std::string &line : lines) output_.Write(line + "\n");
    output_.Write("\n");
  }

  Options options_;
  StopSignals signals_;
  Output output_;
  RedrawnBlock block_{output_};
  bool redraws_ = false;
  Status worst_ = kGood;
  std::unique_ptr<Reading> last_;  // the last good one
};

Status Watch(const Options &options) {
  Watcher watcher(options);
  const auto every = std::chrono::duration_cast<steady_clock::duration>(
      std::chrono::duration<double>(options.every));
  auto next = steady_clock::now();
  for (uint64_t count = 0; watcher.Read() && count < options.count; ++count) {
    next = std::max(next + every, steady_clock::now());
    if (!watcher.WaitUntil(next)) break;
  }
  return watcher.Finish();
}

}  // namespace

void AddWatch(CLI::App &app, Action *action) {
  constexpr double kLeastSeconds = 0.1;  // the controller does no other work while it is read
  CLI::App *command =
      app.add_subcommand("watch", "Print what changes between readings of a controller");
  const auto options = std::make_shared<Options>();
  AddStream(command, &options->stream);
  AddNames(command, &options->names);
  AddNumber(command, "--every", &options->every, kLeastSeconds, kMostSeconds,
            "From one reading to the next (5)");
  AddNumber(command, "--count", &options->count, 0U, UINT32_MAX,
            "Readings after the first; without it, until Ctrl-C");
  command->add_flag("--all", options->all, "List also what did not change");
  command->add_flag("!--no-redraw", options->redraw,
                    "On a terminal, print each block below the one before");
  AddController(command, &options->className, "Read from this one instead of the first");
  AddFormat(command, &options->format, {Format::kNormal, Format::kJson, Format::kCsv});
  command->callback([=] {
    options->filter = MakeFilter({&options->stream, 1}, options->names);
    *action = [=] { return Watch(*options); };
  });
}

}  // namespace tools
