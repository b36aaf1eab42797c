// morwick metrics: the statistics of a controller in the text format that Prometheus collects.

#include <sys/stat.h>

#include <algorithm>
#include <chrono>
#include <map>
#include <memory>
#include <new>

#include "tools/commands.h"
#include "tools/options.h"
#include "tools/statistics.h"
#include "tools/text.h"
#include "tools/write_file.h"

namespace tools {
namespace {

using std::chrono::steady_clock;

constexpr mode_t kCollectorsMode = 0644;  // the collector is another user

struct Options {
  std::vector<std::pair<std::string, std::string>> labels;
  std::vector<std::pair<std::string, std::string>> files;  // by stream
  std::string className;
  std::string output;  // standard output when not named
};

struct Sample {
  std::string name;
  std::string index;  // of an element of an array; empty for a single value
  uint64_t value;
};

// What came of one stream.
struct Reading {
  std::string stream;
  bool good = false;
  double seconds = 0;                    // it took
  std::optional<double> timestamp = {};  // of the data, since 1970
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

// One sample a series: the last value, at the place of the first.
std::vector<Sample> SamplesOf(const Statistics &statistics) {
  std::vector<Sample> samples = {};
  std::map<std::pair<std::string, std::string>, size_t> places;
  for (EntryReader reader(statistics); !reader.AtEnd();) {
    const EntryGroup group = reader.TakeGroup();
    const ContextNode *value = group.value;
    for (size_t i = 0; i < group.count; ++i, value = value->next) {
      const Sample sample = {std::string(group.base), group.IsArray() ? std::to_string(i) : "",
                             value->value};
      const auto [place, isNew] = places.try_emplace({sample.name, sample.index}, samples.size());
      if (isNew) {
        samples.push_back(sample);
      } else {
        samples[place->second].value = sample.value;
      }
    }
  }
  return samples;
}

template <typename ReadDump>
Reading Read(const std::string &stream, ReadDump readDump) {
  Reading reading = {.stream = stream};
  const auto start = steady_clock::now();
  try {
    const Dump dump = readDump();
    if (dump.status == kGood) {
      const Statistics statistics(dump, stream);
      reading.samples = SamplesOf(statistics);
      reading.timestamp = dump.source.kind == "file" ? FileTime(dump.source.name) : Now();
      reading.good = statistics.Judge(dump) == kGood;
    }
  } catch (const std::bad_alloc &) {
    Complain(stream, "out of memory");
  }
  reading.seconds = std::chrono::duration<double>(steady_clock::now() - start).count();
  return reading;
}

std::vector<Reading> ReadFiles(const Options &options) {
  std::vector<Reading> readings;
  for (const auto &pair : options.files) {
    const auto readFile = [&] { return ReadDumpFile(pair.second, pair.first, options.className); };
    readings.push_back(Read(pair.first, readFile));
  }
  return readings;
}

// The class of the controller is set when one was found.
std::vector<Reading> ReadLive(const Options &options, std::string *className) {
  Controller controller(options.className, "kvr");
  *className = controller.name();
  std::vector<Reading> readings;
  readings.push_back(Read("kvr", [&] { return ReadDump(controller, "kvr"); }));
  if (controller.connected() && controller.Offers(*FindBufferKind("msp"))) {
    readings.push_back(Read("msp", [&] { return ReadDump(controller, "msp"); }));
  }
  return readings;
}

// The exposition, family by family.
class Exposition {
 public:
  explicit Exposition(const Options &options) : options_(options) {}

  void Family(const char *name, const char *help) {
    family_ = name;
    text_ += std::string("# HELP ") + name + " " + help + "\n# TYPE " + name + " gauge\n";
  }

  // A label without a value is left out.
  void Line(std::vector<std::pair<std::string, std::string>> labels, const std::string &value) {
    labels.insert(labels.end(), options_.labels.begin(), options_.labels.end());
    std::string list;
    for (const auto &[key, label] : labels) {
      if (label.empty()) continue;
      list += (list.empty() ? "" : ",") + key + "=\"";
      for (const char c : ValidText(label)) {
        if (c == '\\' || c == '"') list += '\\';
        list += c == '\n' ? std::string("\\n") : std::string(1, c);
      }
      list += '"';
    }
    text_ += family_ + "{" + list + "} " + value + "\n";
  }

  const std::string &text() const { return text_; }

 private:
  const Options &options_;
  std::string family_;
  std::string text_;
};

std::string Compose(const Options &options, const std::string &className,
                    const std::vector<Reading> &readings) {
  Exposition exposition(options);
  exposition.Family("morwick_info", "What was read, and with what.");
  exposition.Line({{"controller", className},
                   {"version", MORWICK_VERSION},
                   {"platform", MORWICK_PLATFORM_NAME}},
                  "1");
  exposition.Family("morwick_read_success", "Whether the stream was read whole and good.");
  for (const Reading &reading : readings) {
    exposition.Line({{"stream", reading.stream}}, reading.good ? "1" : "0");
  }
  exposition.Family("morwick_read_duration_seconds", "How long reading the stream took.");
  for (const Reading &reading : readings) {
    exposition.Line({{"stream", reading.stream}}, std::to_string(reading.seconds));
  }
  exposition.Family("morwick_read_timestamp_seconds",
                    "When the stream was read, or its file made.");
  for (const Reading &reading : readings) {
    if (!reading.timestamp) continue;
    exposition.Line({{"stream", reading.stream}}, std::to_string(*reading.timestamp));
  }
  exposition.Family("morwick_statistic", "A statistic that the storage controller reports.");
  for (const Reading &reading : readings) {
    for (const Sample &sample : reading.samples) {
      exposition.Line({{"stream", reading.stream}, {"name", sample.name}, {"index", sample.index}},
                      std::to_string(sample.value));
    }
  }
  return exposition.text();
}

Status Print(const Options &options) {
  std::string className = options.className;
  const std::vector<Reading> readings =
      options.files.empty() ? ReadLive(options, &className) : ReadFiles(options);
  const std::string text = Compose(options, className, readings);
  const Status status = std::ranges::all_of(readings, &Reading::good) ? kGood : kBadData;
  if (!options.output.empty()) {
    return WriteFile(options.output, text, kCollectorsMode) ? status : kBadData;
  }
  Output output;
  output.Write(text);
  return output.Finish(status);
}

// K=V, with a key that Prometheus takes and that is not one of ours.
std::pair<std::string, std::string> SplitLabel(const std::string &text) {
  constexpr std::string_view kOurs[] = {"stream",     "name",    "index",
                                        "controller", "version", "platform"};
  const size_t split = text.find('=');
  const std::string key = text.substr(0, split);
  const auto isLetter = [](char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_';
  };
  const bool good =
      split != std::string::npos && !key.empty() && isLetter(key.front()) &&
      !key.starts_with("__") &&
      std::ranges::all_of(key, [&](char c) { return isLetter(c) || (c >= '0' && c <= '9'); });
  if (!good) throw CLI::ValidationError("--label", text + " is not of the form KEY=VALUE");
  if (std::ranges::find(kOurs, key) != std::end(kOurs)) {
    throw CLI::ValidationError("--label", key + " is a label already");
  }
  return {key, text.substr(split + 1)};
}

std::pair<std::string, std::string> SplitFile(const std::string &text) {
  const size_t split = text.find('=');
  const std::string stream = text.substr(0, split);
  if (split == std::string::npos || std::ranges::find(kStreams, stream) == std::end(kStreams)) {
    throw CLI::ValidationError("STREAM=FILE", text + " does not begin with kvr=, ftl= or msp=");
  }
  return {stream, text.substr(split + 1)};
}

// Takes the pairs of an option, each key once.
template <typename Split>
auto TakePairs(std::vector<std::pair<std::string, std::string>> *pairs, const std::string &option,
               Split split) {
  return [=](const std::vector<std::string> &texts) {
    for (const std::string &text : texts) {
      const auto pair = split(text);
      for (const auto &[key, value] : *pairs) {
        if (key == pair.first) throw CLI::ValidationError(option, key + " is given twice");
      }
      pairs->push_back(pair);
    }
  };
}

}  // namespace

void AddMetrics(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("metrics", "Print the statistics of a controller for Prometheus");
  const auto options = std::make_shared<Options>();
  using Texts = std::vector<std::string>;
  command
      ->add_option_function<Texts>("STREAM=FILE",
                                   TakePairs(&options->files, "STREAM=FILE", SplitFile),
                                   "Of dumps instead, such as kvr=FILE")
      ->type_name("{kvr,ftl,msp}");
  command
      ->add_option_function<Texts>("--label", TakePairs(&options->labels, "--label", SplitLabel),
                                   "A label for all lines")
      ->type_name("KEY=VALUE")
      ->allow_extra_args(false);  // one behind each --label
  AddWrite(command, &options->output, "Write to a file, whole or not at all, mode 0644");
  AddController(command, &options->className,
                "Read from this one instead of the first; with files, where they are from");
  command->callback([=] {
    if (std::ranges::count(options->files, "-", [](const auto &file) { return file.second; }) > 1) {
      throw CLI::ValidationError("STREAM=FILE", "standard input can be read only once");
    }
    *action = [=] { return Print(*options); };
  });
}

}  // namespace tools
