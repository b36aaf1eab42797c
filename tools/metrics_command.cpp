// morwick metrics: prints the statistics of a controller in the text format of Prometheus.

#include <fmt/format.h>
#include <sys/stat.h>

#include <algorithm>
#include <cctype>
#include <chrono>
#include <map>
#include <memory>
#include <new>

#include "tools/commands.h"
#include "tools/input.h"
#include "tools/options.h"
#include "tools/statistics.h"
#include "tools/text.h"
#include "tools/write_file.h"

namespace tools {
namespace {

using std::chrono::steady_clock;

constexpr mode_t kFileMode = 0644;  // the collector reads the file as another user

struct Label {
  std::string key;
  std::string value;
};

struct File {
  MorwickStream stream;
  std::string name;
};

struct Options {
  std::vector<Label> labels;
  std::vector<File> files;
  std::vector<std::string> names;  // of statistics
  Filter filter;
  std::string className;
  std::string output;  // empty for standard output
};

struct Sample {
  std::string name;
  std::string index;  // the index of an array's element; empty for a single value
  uint64_t value;
};

// The result of reading one stream.
struct Reading {
  MorwickStream stream = kMorwickKVR;
  bool good = false;
  double seconds = 0;                    // how long reading took
  std::optional<double> timestamp = {};  // of the data, in seconds since 1970
  std::vector<Sample> samples = {};
};

double Now() {
  using namespace std::chrono;
  return duration<double>(system_clock::now().time_since_epoch()).count();
}

double FileTime(const std::string &file) {
  struct stat status = {};
  if (file == "-" || stat(file.c_str(), &status) != 0) return Now();
  return static_cast<double>(status.st_mtim.tv_sec) +
         static_cast<double>(status.st_mtim.tv_nsec) * 1e-9;
}

// One sample for each series, because Prometheus refuses two: the last value, in the first's place.
std::vector<Sample> SamplesOf(const Statistics &statistics) {
  std::vector<Sample> samples = {};
  std::map<std::pair<std::string, std::string>, size_t> places;
  for (EntryIterator next = statistics.begin(); const auto group = TakeGroup(&next);) {
    group->ForEach([&](const Entry &entry, size_t i) {
      const std::string name(group->base);
      const std::string index = group->IsArray() ? std::to_string(i) : "";
      const auto [place, isNew] = places.try_emplace({name, index}, samples.size());
      if (isNew) samples.push_back({name, index, 0});
      samples[place->second].value = entry.value();
    });
  }
  return samples;
}

// Reads one stream by calling `readDump`.
template <typename ReadDump>
Reading Read(const Options &options, MorwickStream stream, ReadDump readDump) {
  Reading reading = {.stream = stream};
  const auto start = steady_clock::now();
  try {
    const Dump dump = readDump();
    if (dump.bytes) {
      const Statistics statistics(dump, stream, options.filter);
      reading.samples = SamplesOf(statistics);
      reading.timestamp = dump.source.kind == "file" ? FileTime(dump.source.name) : Now();
      reading.good = statistics.Check(dump) == kGood;
    }
  } catch (const std::bad_alloc &) {
    Complain(std::string(fleet::NameOf(stream)), "out of memory");
  }
  reading.seconds = std::chrono::duration<double>(steady_clock::now() - start).count();
  return reading;
}

std::vector<Reading> ReadFiles(const Options &options) {
  std::vector<Reading> readings;
  for (const File &file : options.files) {
    readings.push_back(Read(options, file.stream, [&] {
      return ReadDumpFile(file.name, file.stream, options.className);
    }));
  }
  return readings;
}

// Sets `*className` to the class of the controller, if one was found.
std::vector<Reading> ReadLive(const Options &options, std::string *className) {
  Controller controller(options.className, "kvr");
  *className = controller.name();
  std::vector<Reading> readings;
  const auto read = [&](MorwickStream stream) {
    readings.push_back(Read(options, stream, [&] { return ReadDump(controller, stream); }));
  };
  read(kMorwickKVR);
  if (controller.connected() && controller.Offers(*FindBufferKind("msp"))) read(kMorwickMSP);
  return readings;
}

// Labels as they stand in a line, without those that have no value.
std::string ListOf(const std::vector<Label> &labels) {
  std::string list;
  for (const auto &[key, value] : labels) {
    if (value.empty()) continue;
    list += (list.empty() ? "" : ",") + key + "=\"";
    for (const char c : ValidText(value)) {
      if (c == '\\' || c == '"') list += '\\';
      list += c == '\n' ? std::string("\\n") : std::string(1, c);
    }
    list += '"';
  }
  return list;
}

// The whole text, family by family: a family is all lines of one metric.
std::string Compose(const Options &options, const std::string &className,
                    const std::vector<Reading> &readings) {
  std::string text;
  std::string family;
  const auto begin = [&](const char *name, const char *help) {
    family = name;
    text += fmt::format("# HELP {0} {1}\n# TYPE {0} gauge\n", name, help);
  };
  const auto add = [&](std::vector<Label> labels, const std::string &value) {
    labels.insert(labels.end(), options.labels.begin(), options.labels.end());
    text += fmt::format("{}{{{}}} {}\n", family, ListOf(labels), value);
  };
  const auto streamOf = [](const Reading &reading) {
    return Label{"stream", std::string(fleet::NameOf(reading.stream))};
  };
  begin("morwick_info", "What was read, and with what.");
  add({{"controller", className},
       {"version", MORWICK_VERSION},
       {"platform", MORWICK_PLATFORM_NAME}},
      "1");
  begin("morwick_read_success", "Whether the stream was read whole and good.");
  for (const Reading &reading : readings) add({streamOf(reading)}, reading.good ? "1" : "0");
  begin("morwick_read_duration_seconds", "How long reading the stream took.");
  for (const Reading &reading : readings) {
    add({streamOf(reading)}, std::to_string(reading.seconds));
  }
  begin("morwick_read_timestamp_seconds", "When the stream was read, or its file made.");
  for (const Reading &reading : readings) {
    if (reading.timestamp) add({streamOf(reading)}, std::to_string(*reading.timestamp));
  }
  begin("morwick_statistic", "A statistic that the storage controller reports.");
  for (const Reading &reading : readings) {
    for (const auto &[name, index, value] : reading.samples) {
      add({streamOf(reading), {"name", name}, {"index", index}}, std::to_string(value));
    }
  }
  return text;
}

Status Print(const Options &options) {
  std::string className = options.className;
  const std::vector<Reading> readings =
      options.files.empty() ? ReadLive(options, &className) : ReadFiles(options);
  if (options.files.empty()) NoteUnreadInput();
  const std::string text = Compose(options, className, readings);
  const Status status = std::ranges::all_of(readings, &Reading::good) ? kGood : kBadData;
  return WriteWhole(text, options.output, status, kFileMode);
}

// Splits KEY=VALUE. The key must be valid for Prometheus, and not one of our own.
Label SplitLabel(const std::string &text) {
  constexpr std::string_view kOurs[] = {"stream",     "name",    "index",
                                        "controller", "version", "platform"};
  const size_t split = text.find('=');
  const std::string key = text.substr(0, split);
  const auto isWord = [](unsigned char c) { return c == '_' || std::isalnum(c) != 0; };
  if (split == std::string::npos || key.empty() || key.starts_with("__") ||
      !std::ranges::all_of(key, isWord) || std::isdigit(key.front()) != 0) {
    throw CLI::ValidationError("--label", text + " is not of the form KEY=VALUE");
  }
  if (std::ranges::find(kOurs, key) != std::end(kOurs)) {
    throw CLI::ValidationError("--label", key + " is a label already");
  }
  return {key, text.substr(split + 1)};
}

File SplitFile(const std::string &text) {
  const size_t split = text.find('=');
  const std::optional<MorwickStream> stream = fleet::StreamNamed(text.substr(0, split));
  if (split == std::string::npos || !stream) {
    throw CLI::ValidationError("STREAM=FILE", text + " does not begin with kvr=, ftl= or msp=");
  }
  return {*stream, text.substr(split + 1)};
}

// Returns a function that appends to `pairs` what `split` makes of texts; each key only once.
template <typename Pair, typename Key>
auto TakeOnce(std::vector<Pair> *pairs, Key Pair::*key, Pair (*split)(const std::string &text),
              const std::string &option) {
  return [=](const std::vector<std::string> &texts) {
    for (const std::string &text : texts) {
      Pair pair = split(text);
      if (std::ranges::find(*pairs, pair.*key, key) != pairs->end()) {
        throw CLI::ValidationError(option, text.substr(0, text.find('=')) + " is given twice");
      }
      pairs->push_back(std::move(pair));
    }
  };
}

}  // namespace

void AddMetrics(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("metrics", "Print the statistics of a controller for Prometheus");
  const auto options = std::make_shared<Options>();
  command
      ->add_option_function<std::vector<std::string>>(
          "STREAM=FILE", TakeOnce(&options->files, &File::stream, SplitFile, "STREAM=FILE"),
          "Of dumps instead, such as kvr=FILE")
      ->type_name("{kvr,ftl,msp}");
  AddNames(command, &options->names);
  command
      ->add_option_function<std::vector<std::string>>(
          "--label", TakeOnce(&options->labels, &Label::key, SplitLabel, "--label"),
          "A label for all lines")
      ->type_name("KEY=VALUE")
      ->allow_extra_args(false);  // one for each --label
  AddWrite(command, &options->output, "Write to a file, whole or not at all, mode 0644");
  AddController(command, &options->className,
                "Read from this one instead of the first; with files, where they are from");
  command->callback([=] {
    if (std::ranges::count(options->files, "-", &File::name) > 1) {
      throw CLI::ValidationError("STREAM=FILE", "standard input can be read only once");
    }
    std::vector<MorwickStream> streams;
    for (const File &file : options->files) streams.push_back(file.stream);
    if (streams.empty()) streams = {kMorwickKVR, kMorwickMSP};  // ReadLive reads these two
    options->filter = MakeFilter(streams, options->names);
    *action = [=] { return Print(*options); };
  });
}

}  // namespace tools
