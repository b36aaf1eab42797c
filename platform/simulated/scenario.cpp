// Reads scenario files.

#include "platform/simulated/scenario.h"

// The TOML library asserts conditions that bad input breaks, or tells the compiler to assume them,
// just before the code that refuses such input. Here only that code stays.
#include <toml++/impl/preprocessor.h>
#undef TOML_ASSERT
#undef TOML_ASSERT_ASSUME
#define TOML_ASSERT(condition) static_assert(true)
#define TOML_ASSERT_ASSUME(condition) static_assert(true)
// Each nested value takes some of the stack.
#undef TOML_MAX_NESTED_VALUES
#define TOML_MAX_NESTED_VALUES 16
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

// Takes about ten seconds: discovery, two requests, a deferral between them and the resumed run.
constexpr std::string_view kBuiltInScenario = R"(
[schedule]
defer_at_check = [2]

[[controller]]
class = "VeltoQRN3NVMeController"
pending = 2
)";

constexpr double kLongestSeconds = 1e6;  // far below where a wait would overflow
constexpr size_t kLargestFile = 64 << 10;
constexpr size_t kMostDots = 256;  // in one line

// The first error of a scenario, and its line.
struct BadScenario {
  size_t line;
  std::string reason;
};

[[noreturn]] void Refuse(const toml::source_region &where, const std::string &reason) {
  throw BadScenario{.line = where.begin.line, .reason = reason};
}

// Keeps from the TOML library what it cannot bear: some characters beyond ASCII lead it into
// undefined behaviour, and each dot of a key takes some of the stack.
void CheckText(std::string_view text) {
  size_t line = 1;
  size_t dots = 0;
  for (const char c : text) {
    const bool ascii = static_cast<unsigned char>(c) <= 127;
    if (!ascii) throw BadScenario{line, "a character that is not ASCII"};
    if (c == '.' && ++dots > kMostDots) {
      throw BadScenario{line, "more than " + std::to_string(kMostDots) + " dots in one line"};
    }
    if (c == '\n') {
      ++line;
      dots = 0;
    }
  }
}

[[noreturn]] void Refuse(const toml::node &node, std::string_view key, const std::string &reason) {
  Refuse(node.source(), Quoted(key) + " " + reason);
}

// Each Convert stores the value of a key, or refuses it.
void Convert(const toml::node &node, std::string_view key, bool *target) {
  const auto value = node.value_exact<bool>();
  if (!value) Refuse(node, key, "must be true or false");
  *target = *value;
}

void Convert(const toml::node &node, std::string_view key, uint32_t *target, uint32_t least = 0) {
  const auto value = node.value_exact<int64_t>();
  if (!value) Refuse(node, key, "must be a whole number");
  if (*value < least || *value > std::numeric_limits<uint32_t>::max()) {
    Refuse(node, key, "must be between " + std::to_string(least) + " and 4294967295");
  }
  *target = static_cast<uint32_t>(*value);
}

void Convert(const toml::node &node, std::string_view key, std::vector<uint32_t> *target,
             uint32_t least = 0) {
  const toml::array *array = node.as_array();
  if (array == nullptr) Refuse(node, key, "must be a list of whole numbers");
  for (const toml::node &element : *array) Convert(element, key, &target->emplace_back(), least);
}

void Convert(const toml::node &node, std::string_view key, Fault *target) {
  if (node.is_boolean()) return Convert(node, key, &target->always);
  if (node.is_array()) return Convert(node, key, &target->calls, 1);
  Refuse(node, key, "must be true, false or a list of call numbers");
}

void Convert(const toml::node &node, std::string_view key, std::chrono::milliseconds *target) {
  if (!node.is_number()) Refuse(node, key, "must be a number of seconds");
  const double seconds = node.value<double>().value_or(-1);
  if (!(seconds >= 0 && seconds <= kLongestSeconds)) {
    Refuse(node, key, "must be between 0 and 1000000 seconds");
  }
  *target = std::chrono::milliseconds(std::llround(seconds * 1000));
}

// Names that are not absolute are relative to `folder`.
void AddFile(const toml::node &node, std::string_view key, std::vector<std::string> *target,
             std::string_view folder) {
  const std::string name = node.value_exact<std::string>().value_or("");
  if (name.empty() || name.find('\0') != std::string::npos) {
    Refuse(node, key, "must be a file or a list of files");
  }
  target->push_back(name[0] == '/' ? name : std::string(folder) + name);
}

void Convert(const toml::node &node, std::string_view key, std::vector<std::string> *target,
             std::string_view folder) {
  const toml::array *array = node.as_array();
  if (array == nullptr || array->empty()) return AddFile(node, key, target, folder);
  for (const toml::node &element : *array) AddFile(element, key, target, folder);
}

// One table of the file. A key that was never asked for is unknown.
class TableReader {
 public:
  explicit TableReader(const toml::table &table) : table_(table) {}

  void RefuseOtherKeys() const {
    for (const auto &[key, node] : table_) {
      if (!known_.contains(key.str())) Refuse(key.source(), "unknown key " + Quoted(key.str()));
    }
  }

  const toml::node *Find(std::string_view key) {
    known_.insert(key);
    return table_.get(key);
  }

  // Leaves the target alone when the key is absent.
  template <typename Target>
  void Read(std::string_view key, Target *target, auto... rules) {
    if (const toml::node *node = Find(key)) Convert(*node, key, target, rules...);
  }

 private:
  const toml::table &table_;
  std::set<std::string_view> known_;
};

void ReadController(const toml::table &table, std::string_view folder, Controller *controller) {
  TableReader reader(table);
  const toml::node *name = reader.Find("class");
  if (name == nullptr) Refuse(table.source(), "'class' is missing");
  if (!name->is_string()) Refuse(name->source(), "'class' must be text");
  controller->className = name->value_or(std::string());
  if (RequestMethod(controller->className) == 0) {
    Refuse(name->source(), "unknown controller class " + Quoted(controller->className));
  }
  reader.Read("pending", &controller->pending);
  reader.Read("vanish", &controller->vanish);
  reader.Read("refuse_open", &controller->refuseOpen);
  reader.Read("fail_request", &controller->failRequest);
  reader.Read("fail_read", &controller->failRead);
  reader.Read("short_read", &controller->shortRead);
  reader.Read("fail_close", &controller->failClose);
  for (const Buffer &buffer : kBuffers) {
    reader.Read(buffer.key, &controller->files[buffer.key], folder);
  }
  reader.RefuseOtherKeys();
}

void ReadControllers(const toml::node &node, std::string_view folder,
                     std::vector<Controller> *controllers) {
  const toml::array *array = node.as_array();
  if (array == nullptr) Refuse(node.source(), "'controller' must be [[controller]]");
  for (const toml::node &element : *array) {
    if (!element.is_table()) Refuse(element.source(), "a controller must be a table");
    Controller controller;
    ReadController(*element.as_table(), folder, &controller);
    for (const Controller &other : *controllers) {
      if (other.className != controller.className) continue;
      Refuse(element.source(), "a second controller of class " + Quoted(other.className));
    }
    controllers->push_back(std::move(controller));
  }
}

Scenario ReadScenario(const toml::table &table, std::string_view folder) {
  Scenario scenario;
  TableReader reader(table);
  const auto subtable = [&](std::string_view key, auto read) {
    const toml::node *node = reader.Find(key);
    if (node == nullptr) return;
    if (!node->is_table()) Refuse(node->source(), Quoted(key) + " must be a table");
    TableReader subreader(*node->as_table());
    read(subreader);
    subreader.RefuseOtherKeys();
  };
  subtable("log", [&](TableReader &log) { log.Read("enabled", &scenario.logEnabled); });
  subtable("schedule", [&](TableReader &schedule) {
    schedule.Read("runs", &scenario.schedule.runs);
    schedule.Read("first_run_after", &scenario.schedule.firstRunAfter);
    schedule.Read("interval", &scenario.schedule.interval);
    schedule.Read("resume_after", &scenario.schedule.resumeAfter);
    schedule.Read("defer_at_check", &scenario.schedule.deferAtCheck);
  });
  if (const toml::node *controllers = reader.Find("controller")) {
    ReadControllers(*controllers, folder, &scenario.controllers);
  }
  reader.RefuseOtherKeys();
  return scenario;
}

std::optional<Scenario> LoadScenario() {
  const char *file = std::getenv("GRELLON_SCENARIO");
  std::string text(kBuiltInScenario);
  std::string error;
  if (file == nullptr || *file == '\0') {
    file = "built-in";
  } else {
    if (const int number = ReadFile(file, kLargestFile + 1, &text); number != 0) {
      error = Printable(file) + ": " + std::strerror(number);
    } else if (text.size() > kLargestFile) {
      error = Printable(file) + ": larger than " + std::to_string(kLargestFile >> 10) + " KiB";
    }
  }
  std::optional<Scenario> scenario;
  if (error.empty()) scenario = ParseScenario(text, file, &error);
  if (!scenario) Complain(error);
  return scenario;
}

}  // namespace

bool Fault::Hits() { return std::ranges::count(calls, ++count) > 0 || always; }

uint32_t RequestMethod(std::string_view className) {
  if (className == "VeltoQRN3NVMeController") return 9;
  if (className == "VeltoEmbeddedNVMeController") return 9;
  if (className == "KVRStorage") return 8;
  return 0;
}

std::optional<Scenario> ParseScenario(std::string_view text, const std::string &file,
                                      std::string *error) {
  const auto refuse = [&](size_t line, std::string_view reason) {
    *error = Printable(file) + ":" + std::to_string(line) + ": " + Printable(reason);
    return std::nullopt;
  };
  try {
    CheckText(text);
    const toml::parse_result result = toml::parse(text);
    if (!result) {
      return refuse(result.error().source().begin.line, result.error().description());
    }
    return ReadScenario(result.table(), file.substr(0, file.rfind('/') + 1));
  } catch (const BadScenario &bad) {
    return refuse(bad.line, bad.reason);
  }
}

const Scenario *TheScenario() {
  static const std::optional<Scenario> scenario = LoadScenario();
  return scenario ? &*scenario : nullptr;
}

}  // namespace simulated
