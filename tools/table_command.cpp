// morwick table: prints many dumps as one table, one row each.

#include <fmt/format.h>
#include <malloc.h>
#include <pthread.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <charconv>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>
#include <thread>

#include "fleet/table.h"
#include "tools/commands.h"
#include "tools/input.h"
#include "tools/memory.h"
#include "tools/options.h"
#include "tools/stop_signals.h"
#include "tools/text.h"

namespace tools {
namespace {

using std::chrono::milliseconds;

void AppendRow(const fleet::Row &row, std::string *rows) {
  // A line end in a name would forge a row at a terminal, even where the field is quoted.
  static const bool terminal = OutputIsTerminal();
  AppendCsvField(rows, terminal ? PrintableLine(row.file.name) : row.file.name);
  *rows += ',';
  AppendCsvField(rows, row.file.fault);
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

// The command limits its memory. Threads with stacks and heaps of the usual size would take most of
// it.
void KeepThreadsSmall() {
  constexpr size_t kStackSize = 512 << 10;  // bytes; 8 MiB are usual
  mallopt(M_ARENA_MAX, 2);
  pthread_attr_t attributes;
  if (pthread_attr_init(&attributes) != 0) return;
  pthread_attr_setstacksize(&attributes, kStackSize);
  pthread_setattr_default_np(&attributes);
  pthread_attr_destroy(&attributes);
}

// Opens the list of names, if there is one. False after a complaint.
bool OpenList(const Options &options, std::FILE **list) {
  *list = options.list.empty()  ? nullptr
          : options.list == "-" ? stdin
                                : std::fopen(options.list.c_str(), "re");
  if (*list != nullptr || options.list.empty()) return true;
  if (errno == ENOMEM) throw std::bad_alloc();
  Complain(options.list, std::strerror(errno));
  return false;
}

// Whether names come through a pipe, maybe one by one: then each row is printed at once.
bool IsPipe(std::FILE *list) {
  struct stat status = {};
  return list != nullptr && fstat(fileno(list), &status) == 0 && !S_ISREG(status.st_mode);
}

fleet::FileList FilesOf(const Options &options, std::FILE *list) {
  return fleet::FileList(options.files, list, options.endedByNul ? '\0' : '\n');
}

// Counts the files by going through all names, so that none is kept in memory. That takes time, so
// a thread does it beside the others. `total` stays 0 when the names can be read only once.
std::jthread CountFiles(const Options &options, std::atomic<uint64_t> *total) {
  std::FILE *list = nullptr;
  if (options.list == "-" || !OpenList(options, &list)) return {};
  return std::jthread([files = FilesOf(options, list), total](const std::stop_token &stop) mutable {
    uint64_t count = 0;
    try {
      for (fleet::ListedFile file; files.Next(&file); ++count) {
        if (stop.stop_requested()) return;
      }
    } catch (const std::bad_alloc &) {  // the threads that read will say so
      return;
    }
    *total = count;
  });
}

void PrintHeading(Output &output, const fleet::Selection &selection) {
  output.Write("file,fault");
  for (const auto &column : selection.columns()) {
    output.Put(',');
    output.Write(column.name);
  }
  output.Put('\n');
}

// Complains of the faults in a batch. Returns their number.
uint64_t ComplainOf(const fleet::Batch &batch, ProgressLine &progress) {
  uint64_t faults = 0;
  for (const fleet::ListedFile &file : batch.files) {
    if (file.fault.empty()) continue;
    if (faults++ == 0) progress.Clear();
    Complain(DisplayName(file.name), file.fault);
  }
  return faults;
}

// Writes the rows of a batch one by one, so that a signal ends the output after a whole row. False
// when the output must end.
bool WriteRows(Output &output, const fleet::Batch &batch) {
  const std::string_view rows = batch.rows;
  size_t begin = 0;
  for (const size_t end : batch.rowEnds) {
    if (StopSignals::Stopped() != 0 || !output.Write(rows.substr(begin, end - begin))) return false;
    begin = end;
  }
  return true;
}

// Prints the rows when they are ready, until a signal or a reader that has gone away ends the
// output early. Complains when the list of names ended early.
Status PrintRows(const Options &options, std::FILE *list, bool showProgress, Output &output) {
  using Got = fleet::Table::Got;
  fleet::Table table(options.table, FilesOf(options, list));
  std::atomic<uint64_t> total = 0;
  const std::jthread counting =
      showProgress && options.table.batchSize > 1 ? CountFiles(options, &total) : std::jthread();
  ProgressLine progress(showProgress, milliseconds(300));
  uint64_t dumps = 0;
  uint64_t faults = 0;
  for (Got got = Got::kNothingYet; got != Got::kEnd;) {
    if (StopSignals::Stopped() != 0) return kBadData;
    std::unique_ptr<fleet::Batch> batch;
    got = table.Next(&batch, milliseconds(0));
    if (progress.IsDue()) {
      const std::string ofTotal = total == 0 ? "" : fmt::format(" of {}", total.load());
      fmt::print(stderr, "\r\033[Kmorwick: dumps read: {}{}, with a fault: {}", dumps, ofTotal,
                 faults);
    }
    if (got == Got::kNothingYet) {
      if (!output.Flush()) return kBadData;
      got = table.Next(&batch, milliseconds(50));
    }
    if (got != Got::kBatch) continue;
    if (!WriteRows(output, *batch)) return kBadData;
    dumps += batch->files.size();
    faults += ComplainOf(*batch, progress);
    if (batch->outOfMemory) ThrowOutOfMemory();
  }
  if (table.outOfMemory()) ThrowOutOfMemory();
  if (table.listFault().empty()) return faults == 0 ? kGood : kBadData;
  progress.Clear();
  Complain(DisplayName(options.list), table.listFault());
  return kBadData;
}

Status PrintTable(Options options) {
  std::FILE *list = nullptr;
  if (!OpenList(options, &list)) return kUnreadable;
  if (IsPipe(list)) options.table.batchSize = 1;
  const bool showProgress = isatty(STDERR_FILENO) != 0 && !OutputIsTerminal();
  StopSignals signals;
  Output output;
  PrintHeading(output, *options.table.selection);
  output.Flush();
  KeepThreadsSmall();
  Status status = kBadData;
  try {
    status = PrintRows(options, list, showProgress, output);
  } catch (const std::bad_alloc &) {
    output.Flush();  // or the last row would be cut
    throw;
  }
  if (StopSignals::Stopped() != 0) {
    output.Flush();
    StopSignals::EndProcess();
  }
  return output.Finish(status);
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
  AddNumber(command, "-j,--jobs", &options->table.jobs, 1U, UINT32_MAX,
            "Threads; without it as many as there are cores");
  command->callback([=] {
    if (options->files.empty() && options->list.empty()) {
      throw CLI::ValidationError("FILE|FOLDER", "is needed, or --files-from");
    }
    if (std::ranges::count(options->files, "-") + (options->list == "-" ? 1 : 0) > 1) {
      throw CLI::ValidationError("FILE|FOLDER", "standard input can be read only once");
    }
    options->table.selection = Select({&options->table.stream, 1}, options->names);
    *action = [=] { return PrintTable(*options); };
  });
}

}  // namespace tools
