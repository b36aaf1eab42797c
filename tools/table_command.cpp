// morwick table: many dumps as one table, a row each.

#include <fmt/format.h>
#include <malloc.h>
#include <pthread.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <chrono>
#include <cstring>
#include <memory>
#include <optional>

#include "fleet/table.h"
#include "tools/commands.h"
#include "tools/input.h"
#include "tools/memory.h"
#include "tools/options.h"
#include "tools/stop_signals.h"

namespace tools {
namespace {

using std::chrono::milliseconds;
using std::chrono::steady_clock;

// A field of CSV; in quotes where it needs them.
void AppendField(std::string *row, std::string_view field) {
  if (field.find_first_of(",\"\r\n") == std::string_view::npos) {
    row->append(field);
    return;
  }
  *row += '"';
  for (const char c : field) row->append(c == '"' ? 2 : 1, c);
  *row += '"';
}

void AppendRow(const fleet::Row &row, std::string *rows) {
  AppendField(rows, row.file.name);
  *rows += ',';
  AppendField(rows, row.file.fault);
  for (size_t i = 0; i < row.values.size(); ++i) {
    *rows += ',';
    if (row.present[i] == 0) continue;
    char digits[20];
    rows->append(digits, std::to_chars(digits, std::end(digits), row.values[i]).ptr);
  }
  *rows += '\n';
}

struct Options {
  fleet::TableOptions table = {.appendRow = AppendRow};
  std::vector<std::string> names;
  std::vector<std::string> files;
  std::string list;
  bool endedByNul = false;
};

// A line on the terminal that says how far it has come.
class Progress {
 public:
  // Of so many dumps, if that is known.
  Progress(bool isShown, std::optional<uint64_t> total) : isShown_(isShown) {
    if (total) ofTotal_ = fmt::format(" of {}", *total);
  }
  ~Progress() { Clear(); }

  void Show(uint64_t dumps, uint64_t faults) {
    if (!isShown_ || steady_clock::now() < next_) return;
    next_ = steady_clock::now() + milliseconds(200);
    there_ = true;
    fmt::print(stderr, "\r\033[Kmorwick: dumps read: {}{}, with a fault: {}", dumps, ofTotal_,
               faults);
  }

  void Clear() {
    if (there_) fmt::print(stderr, "\r\033[K");
    there_ = false;
  }

 private:
  bool isShown_;
  std::string ofTotal_;
  steady_clock::time_point next_ = steady_clock::now() + milliseconds(300);
  bool there_ = false;
};

// Threads of the command count against its own limit of memory: stacks and heaps of their own would
// use up most of it.
void KeepThreadsSmall() {
  constexpr size_t kStack = 512 << 10;
  mallopt(M_ARENA_MAX, 2);
  pthread_attr_t attributes;
  if (pthread_attr_init(&attributes) != 0) return;
  pthread_attr_setstacksize(&attributes, kStack);
  pthread_setattr_default_np(&attributes);
  pthread_attr_destroy(&attributes);
}

// The list of names, if there is one. False, and said, when it cannot be opened.
bool OpenList(const Options &options, std::FILE **list) {
  *list = options.list.empty()  ? nullptr
          : options.list == "-" ? stdin
                                : std::fopen(options.list.c_str(), "re");
  if (*list != nullptr || options.list.empty()) return true;
  Complain(options.list, std::strerror(errno));
  return false;
}

// Names from a pipe may come one by one, and each wants its row.
bool IsPipe(std::FILE *list) {
  struct stat status = {};
  return list != nullptr && fstat(fileno(list), &status) == 0 && !S_ISREG(status.st_mode);
}

fleet::FileList FilesOf(const Options &options, std::FILE *list) {
  return fleet::FileList(options.files, list, options.endedByNul ? '\0' : '\n');
}

// How many files there are, found by going through all names once more, so that none is kept in
// memory. Nothing when the names can be read only once.
std::optional<uint64_t> CountFiles(const Options &options) {
  std::FILE *list = nullptr;
  if (options.list == "-" || !OpenList(options, &list)) return std::nullopt;
  fleet::FileList files = FilesOf(options, list);
  uint64_t count = 0;
  for (fleet::ListedFile file; files.Next(&file);) ++count;
  return count;
}

void PrintHeading(Output &output, const fleet::Selection &selection) {
  output.Write("file,fault");
  for (const auto &column : selection.columns()) {
    output.Put(',');
    output.Write(column.name);
  }
  output.Put('\n');
}

// Says what is wrong with the dumps of a batch. Returns with how many something is.
uint64_t ComplainOf(const fleet::Batch &batch, Progress &progress) {
  uint64_t faults = 0;
  for (const fleet::ListedFile &file : batch.files) {
    if (file.fault.empty()) continue;
    if (faults++ == 0) progress.Clear();
    Complain(file.name, file.fault);
  }
  return faults;
}

// Prints the rows as they come. Returns the status of the dumps; nothing when the rows are not to
// their end, for a signal or because nobody takes them.
std::optional<Status> PrintRows(Output &output, fleet::Table &table, Progress &progress) {
  using Got = fleet::Table::Got;
  uint64_t dumps = 0;
  uint64_t faults = 0;
  while (StopSignals::Stopped() == 0) {
    std::unique_ptr<fleet::Batch> batch;
    Got got = table.Next(&batch, milliseconds(0));
    if (got == Got::kNothingYet) {
      if (!output.Flush()) return std::nullopt;
      progress.Show(dumps, faults);
      got = table.Next(&batch, milliseconds(50));
    }
    if (got == Got::kEnd) return faults == 0 ? kGood : kBadData;
    if (got == Got::kNothingYet) continue;
    if (!output.Write(batch->rows)) return std::nullopt;
    dumps += batch->files.size();
    faults += ComplainOf(*batch, progress);
    if (batch->outOfMemory) RefuseMemory();
  }
  return std::nullopt;
}

// The same, and says why the list or the rows are not to their end.
std::optional<Status> PrintRows(const Options &options, std::FILE *list,
                                std::optional<uint64_t> total, bool showProgress, Output &output) {
  fleet::Table table(options.table, FilesOf(options, list));
  Progress progress(showProgress, total);
  const std::optional<Status> status = PrintRows(output, table, progress);
  if (table.outOfMemory()) RefuseMemory();
  if (!status || table.listError() == 0) return status;
  progress.Clear();
  Complain(DisplayName(options.list), std::strerror(table.listError()));
  return kBadData;
}

Status PrintTable(Options options) {
  std::FILE *list = nullptr;
  if (!OpenList(options, &list)) return kBadUsage;
  const bool isPipe = IsPipe(list);
  if (isPipe) options.table.batchSize = 1;
  const bool showProgress = isatty(STDERR_FILENO) != 0 && !OutputIsTerminal();
  std::optional<uint64_t> total;
  if (showProgress && !isPipe) total = CountFiles(options);
  StopSignals signals;
  Output output;
  PrintHeading(output, *options.table.selection);
  KeepThreadsSmall();
  const auto status = PrintRows(options, list, total, showProgress, output);
  if (StopSignals::Stopped() != 0) {
    output.Flush();
    StopSignals::EndProcess();
  }
  return output.Finish(status.value_or(kBadData));
}

}  // namespace

void AddTable(CLI::App &app, Action *action) {
  CLI::App *command = app.add_subcommand("table", "Print many dumps as one table, a row each");
  const auto options = std::make_shared<Options>();
  command->add_option("FILE|FOLDER", options->files, "Dumps; a folder stands for all files in it")
      ->type_name("");
  AddStream(command, &options->table.stream);
  AddNames(command, &options->names);
  CLI::Option *list =
      command
          ->add_option("--files-from", options->list,
                       "Read names of dumps from this file, a line each; - for standard input")
          ->type_name("FILE");
  command->add_flag("-0", options->endedByNul, "Names in the list end with a NUL")->needs(list);
  AddNumber(command, "-j,--jobs", &options->table.jobs, 1, UINT32_MAX,
            "Threads; without it as many as there are cores");
  command->callback([=] {
    if (options->files.empty() && options->list.empty()) {
      throw CLI::ValidationError("FILE|FOLDER", "is needed, or --files-from");
    }
    if (options->list == "-" && std::ranges::count(options->files, "-") > 0) {
      throw CLI::ValidationError("--files-from", "standard input can be read only once");
    }
    options->table.selection = Select({&options->table.stream, 1}, options->names);
    *action = [=] { return PrintTable(*options); };
  });
}

}  // namespace tools
