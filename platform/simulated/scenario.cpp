// Reads scenario files.

#include "platform/simulated/scenario.h"

#include <toml++/toml.h>
#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <optional>
#include <set>

#include "platform/simulated/files.h"

namespace simulated {
namespace {

// Discovery, two requests, a deferral between them and the resumed run, in some ten seconds.
constexpr std::string_view kBuiltInScenario = R"(
[schedule]
defer_at_check = [2]

[[controller]]
class = "VeltoQRN3NVMeController"
pending = 2
)";

constexpr double kLongestSeconds = 1e6;
constexpr size_t kLargestFile = 1 << 20;

// The first error found, with the place it was found at.
class Report {
 public:
  explicit Report(const std::string &file) : file_(file) {}

  void Add(const toml::source_region &where, const std::string &reason) {
    if (!text_.empty()) return;
    text_ = file_ + ":" + std::to_string(where.begin.line) + ": " + reason;
  }
  const std::string &text() const { return text_; }

 private:
  const std::string &file_;
  std::string text_;
};

// One table of the file. Each Read takes one key and leaves the target alone when the key is
// absent; whatever no Read has asked for is unknown.
class TableReader {
 public:
  TableReader(const toml::table &table, Report &report) : table_(table), report_(report) {}
  TableReader(const TableReader &) = delete;
  TableReader &operator=(const TableReader &) = delete;

  ~TableReader() {
    for (const auto &[key, node] : table_) {
      if (!known_.contains(key.str())) {
        report_.Add(key.source(), "unknown key " + Quoted(key.str()));
      }
    }
  }

  const toml::node *Find(std::string_view key) {
    known_.insert(key);
    return table_.get(key);
  }

  void Read(std::string_view key, bool *target) {
    const toml::node *node = Find(key);
    if (node == nullptr) return;
    if (const auto value = node->value_exact<bool>()) {
      *target = *value;
    } else {
      Reject(*node, key, "must be true or false");
    }
  }

  void Read(std::string_view key, uint32_t *target) {
    if (const toml::node *node = Find(key)) ReadNumber(*node, key, 0, target);
  }

  void Read(std::string_view key, std::vector<uint32_t> *target, uint32_t least) {
    const toml::node *node = Find(key);
    if (node == nullptr) return;
    const toml::array *array = node->as_array();
    if (array == nullptr) return Reject(*node, key, "must be a list of whole numbers");
    for (const toml::node &element : *array) {
      ReadNumber(element, key, least, &target->emplace_back());
    }
  }

  void Read(std::string_view key, Fault *target) {
    const toml::node *node = Find(key);
    if (node == nullptr) return;
    if (node->is_boolean()) return Read(key, &target->always);
    if (node->is_array()) return Read(key, &target->calls, 1);
    Reject(*node, key, "must be true, false or a list of call numbers");
  }

  void Read(std::string_view key, std::chrono::milliseconds *target) {
    const toml::node *node = Find(key);
    if (node == nullptr) return;
    if (!node->is_number()) return Reject(*node, key, "must be a number of seconds");
    const double seconds = node->value<double>().value_or(-1);
    if (!(seconds >= 0 && seconds <= kLongestSeconds)) {
      return Reject(*node, key, "must be between 0 and 1000000 seconds");
    }
    *target = std::chrono::milliseconds(std::llround(seconds * 1000));
  }

  // A file or some, whose names are put behind `folder`.
  void Read(std::string_view key, std::vector<std::string> *target, std::string_view folder) {
    const toml::node *node = Find(key);
    if (node == nullptr) return;
    const toml::array *array = node->as_array();
    if (array == nullptr) return ReadFileName(*node, key, folder, target);
    if (array->empty()) Reject(*node, key, kNotFiles);
    for (const toml::node &element : *array) ReadFileName(element, key, folder, target);
  }

 private:
  static constexpr const char *kNotFiles = "must be a file or a list of files";

  void ReadFileName(const toml::node &node, std::string_view key, std::string_view folder,
                    std::vector<std::string> *target) {
    const std::string name = node.value_exact<std::string>().value_or("");
    if (name.empty() || name.find('\0') != std::string::npos) return Reject(node, key, kNotFiles);
    target->push_back(name[0] == '/' ? name : std::string(folder) + name);
  }

  void Reject(const toml::node &node, std::string_view key, const std::string &reason) {
    report_.Add(node.source(), Quoted(key) + " " + reason);
  }

  void ReadNumber(const toml::node &node, std::string_view key, uint32_t least, uint32_t *target) {
    const auto value = node.value_exact<int64_t>();
    if (!value) return Reject(node, key, "must be a whole number");
    if (*value < least || *value > std::numeric_limits<uint32_t>::max()) {
      return Reject(node, key, "must be between " + std::to_string(least) + " and 4294967295");
    }
    *target = static_cast<uint32_t>(*value);
  }

  const toml::table &table_;
  Report &report_;
  std::set<std::string_view> known_;
};

void ReadController(const toml::table &table, std::string_view folder, Report &report,
                    Controller *controller) {
  TableReader reader(table, report);
  if (const toml::node *name = reader.Find("class"); name == nullptr) {
    report.Add(table.source(), "'class' is missing");
  } else if (!name->is_string()) {
    report.Add(name->source(), "'class' must be text");
  } else {
    controller->className = name->value_or(std::string());
    if (RequestMethod(controller->className) == 0) {
      report.Add(name->source(), "unknown controller class " + Quoted(controller->className));
    }
  }
  reader.Read("pending", &controller->pending);
  reader.Read("vanish", &controller->vanish);
  reader.Read("refuse_open", &controller->refuseOpen);
  reader.Read("fail_request", &controller->failRequest);
  reader.Read("fail_read", &controller->failRead);
  reader.Read("short_read", &controller->shortRead);
  reader.Read("fail_close", &controller->failClose);
  for (const auto &[key, command] : kBuffers) {
    reader.Read(key, &controller->files[command], folder);
  }
}

void ReadControllers(const toml::node &node, std::string_view folder, Report &report,
                     std::vector<Controller> *controllers) {
  const toml::array *array = node.as_array();
  if (array == nullptr) return report.Add(node.source(), "'controller' must be [[controller]]");
  for (const toml::node &element : *array) {
    if (!element.is_table()) return report.Add(element.source(), "a controller must be a table");
    ReadController(*element.as_table(), folder, report, &controllers->emplace_back());
    const std::string &className = controllers->back().className;
    if (std::count_if(controllers->begin(), controllers->end(),
                      [&](const Controller &other) { return other.className == className; }) > 1) {
      report.Add(element.source(), "a second controller of class " + Quoted(className));
    }
  }
}

void ReadSchedule(const toml::table &table, Report &report, Schedule *schedule) {
  TableReader reader(table, report);
  reader.Read("runs", &schedule->runs);
  reader.Read("first_run_after", &schedule->firstRunAfter);
  reader.Read("interval", &schedule->interval);
  reader.Read("resume_after", &schedule->resumeAfter);
  reader.Read("defer_at_check", &schedule->deferAtCheck, 0);
}

void ReadScenario(const toml::table &table, std::string_view folder, Report &report,
                  Scenario *scenario) {
  TableReader reader(table, report);
  const auto subtable = [&](std::string_view key, auto read) {
    const toml::node *node = reader.Find(key);
    if (node == nullptr) return;
    if (!node->is_table()) {
      return report.Add(node->source(), Quoted(key) + " must be a table");
    }
    read(*node->as_table());
  };
  subtable("log", [&](const toml::table &log) {
    TableReader(log, report).Read("enabled", &scenario->logEnabled);
  });
  subtable("schedule", [&](const toml::table &schedule) {
    ReadSchedule(schedule, report, &scenario->schedule);
  });
  if (const toml::node *controllers = reader.Find("controller")) {
    ReadControllers(*controllers, folder, report, &scenario->controllers);
  }
}

std::optional<Scenario> LoadScenario() {
  const char *file = std::getenv("GRELLON_SCENARIO");
  std::string text(kBuiltInScenario);
  std::string error;
  if (file == nullptr || *file == '\0') {
    file = "built-in";
  } else {
    text.resize(kLargestFile + 1);
    size_t size = 0;
    if (const int number = ReadFile(file, text.data(), text.size(), &size); number != 0) {
      error = std::string(file) + ": " + std::strerror(number);
    } else if (size > kLargestFile) {
      error = std::string(file) + ": larger than a mebibyte";
    }
    text.resize(size);
  }
  Scenario scenario;
  if (error.empty() && ParseScenario(text, file, &scenario, &error)) return scenario;
  Complain(error);
  return std::nullopt;
}

}  // namespace

bool Fault::Hits(uint32_t call) const {
  return always || std::find(calls.begin(), calls.end(), call) != calls.end();
}

uint32_t RequestMethod(std::string_view className) {
  if (className == "VeltoQRN3NVMeController") return 9;
  if (className == "VeltoEmbeddedNVMeController") return 9;
  if (className == "KVRStorage") return 8;
  return 0;
}

bool ParseScenario(std::string_view text, const std::string &file, Scenario *scenario,
                   std::string *error) {
  Report report(file);
  // The TOML library's tables of characters beyond ASCII run into undefined behaviour for some.
  size_t line = 1;
  for (const char c : text) {
    if (static_cast<unsigned char>(c) > 127) {
      *error = file + ":" + std::to_string(line) + ": a character that is not ASCII";
      return false;
    }
    if (c == '\n') ++line;
  }
  const toml::parse_result result = toml::parse(text);
  if (result) {
    const std::string folder = file.substr(0, file.rfind('/') + 1);
    ReadScenario(result.table(), folder, report, scenario);
  } else {
    report.Add(result.error().source(), std::string(result.error().description()));
  }
  *error = report.text();
  return error->empty();
}

const Scenario *TheScenario() {
  static const std::optional<Scenario> scenario = LoadScenario();
  return scenario ? &*scenario : nullptr;
}

const Scenario &RequireScenario() {
  const Scenario *scenario = TheScenario();
  if (scenario == nullptr) std::exit(2);
  return *scenario;
}

}  // namespace simulated
