// morwick table: many dumps as one table, a row each.

#include <fmt/format.h>
#include <malloc.h>
#include <pthread.h>
#include <sched.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <chrono>
#include <condition_variable>
#include <cstring>
#include <memory>
#include <mutex>
#include <new>
#include <optional>
#include <system_error>
#include <thread>

#include "fleet/columns.h"
#include "fleet/dump.h"
#include "fleet/file_list.h"
#include "tools/commands.h"
#include "tools/input.h"
#include "tools/memory.h"
#include "tools/options.h"
#include "tools/stop_signals.h"

namespace tools {
namespace {

using std::chrono::milliseconds;
using std::chrono::steady_clock;

constexpr size_t kBatchSize = 16;      // dumps that a thread takes at once
constexpr uint64_t kBatchesAhead = 8;  // for each thread, before the first of them is printed

struct Options {
  MorwickStream stream = kMorwickKVR;
  std::vector<std::string> names;
  Filter selection;
  std::vector<std::string> files;
  std::string list;
  bool endedByNul = false;
  uint64_t jobs = 0;
};

// What is to be said of one dump.
struct Complaint {
  std::string file;
  std::string fault;
};

// Some rows of the table, as they are printed.
struct Batch {
  std::vector<fleet::ListedFile> files;
  std::string rows;
  std::vector<Complaint> complaints;
  bool outOfMemory = false;  // rows are missing
};

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

// Makes rows. One for each thread.
class RowMaker {
 public:
  explicit RowMaker(const Options &options)
      : filler_(options.stream, *options.selection),
        values_(options.selection->columns().size()),
        present_(values_.size()) {}

  void Make(Batch *batch) {
    for (const fleet::ListedFile &file : batch->files) {
      const size_t before = batch->rows.size();
      try {
        AddRow(file, batch);
      } catch (const std::bad_alloc &) {
        batch->rows.resize(before);
        batch->outOfMemory = true;
        return;
      }
    }
  }

 private:
  void AddRow(const fleet::ListedFile &file, Batch *batch) {
    std::ranges::fill(present_, 0);
    const std::string fault = file.fault.empty() ? Read(file) : file.fault;
    std::string &rows = batch->rows;
    AppendField(&rows, file.name);
    rows += ',';
    AppendField(&rows, fault);
    for (size_t i = 0; i < values_.size(); ++i) {
      rows += ',';
      if (present_[i] == 0) continue;
      char digits[20];
      rows.append(digits, std::to_chars(digits, std::end(digits), values_[i]).ptr);
    }
    rows += '\n';
    if (!fault.empty()) batch->complaints.push_back({file.name, fault});
  }

  // Takes the values of a dump, and says what is wrong with it.
  std::string Read(const fleet::ListedFile &file) {
    const fleet::DumpReader::Dump dump = reader_.Read(file.name.c_str(), file.inFolder);
    if (!dump.fault.empty() && dump.bytes.empty()) return dump.fault;
    const fleet::Verdict verdict = filler_.Fill(dump.bytes, values_, present_);
    std::string fault = dump.fault;
    // Of what could not be read to its end the end of the statistics says nothing.
    if (!fault.empty()) return fault;
    for (const std::string &each : verdict.faults) fault += (fault.empty() ? "" : "; ") + each;
    return fault;
  }

  fleet::DumpReader reader_;
  fleet::ColumnFiller filler_;
  std::vector<uint64_t> values_;
  std::vector<uint8_t> present_;
};

// Batches made by several threads and handed out in the order of their files.
class OrderedBatches {
 public:
  // Threads may be so many batches ahead of what is handed out.
  OrderedBatches(const Options &options, fleet::FileList list, size_t batchSize, size_t ahead)
      : options_(options), list_(std::move(list)), batchSize_(batchSize), made_(ahead) {}

  // What a thread does.
  void Work() {
    std::optional<RowMaker> maker;
    for (;;) {
      uint64_t number = 0;
      auto batch = std::make_unique<Batch>();
      try {
        if (!maker) maker.emplace(options_);
        if (!Take(batch.get(), &number)) return;
      } catch (const std::bad_alloc &) {
        Fail();
        return;
      }
      maker->Make(batch.get());
      const std::lock_guard lock(mutex_);
      made_[number % made_.size()] = std::move(batch);
      isMade_.notify_one();
    }
  }

  enum class Got { kBatch, kNothingYet, kEnd };

  // The next batch in turn, if it comes in time.
  Got Next(std::unique_ptr<Batch> *batch, milliseconds time) {
    std::unique_lock lock(mutex_);
    std::unique_ptr<Batch> &next = made_[printed_ % made_.size()];
    isMade_.wait_for(lock, time, [&] { return next != nullptr || AtEnd(); });
    if (next == nullptr) return AtEnd() ? Got::kEnd : Got::kNothingYet;
    *batch = std::move(next);
    ++printed_;
    isWanted_.notify_all();
    return Got::kBatch;
  }

  // Threads take no more.
  void Stop() {
    const std::lock_guard lock(mutex_);
    stopped_ = true;
    isWanted_.notify_all();
  }

  int listError() const { return list_.error(); }
  bool failed() const { return failed_; }

 private:
  bool AtEnd() const { return failed_ || (listEnded_ && printed_ == taken_); }

  void Fail() {
    const std::lock_guard lock(mutex_);
    failed_ = stopped_ = true;
    isMade_.notify_one();
    isWanted_.notify_all();
  }

  // The next files. False when there are none, or no more are wanted.
  bool Take(Batch *batch, uint64_t *number) {
    // Reading the list may take time: what is made meanwhile is handed out all the same.
    const std::lock_guard listLock(listMutex_);
    {
      std::unique_lock lock(mutex_);
      isWanted_.wait(lock, [&] { return stopped_ || taken_ < printed_ + made_.size(); });
      if (stopped_ || listEnded_) return false;
    }
    fleet::ListedFile file;
    while (batch->files.size() < batchSize_ && list_.Next(&file)) {
      batch->files.push_back(std::move(file));
    }
    const std::lock_guard lock(mutex_);
    listEnded_ = batch->files.size() < batchSize_;
    if (listEnded_) isMade_.notify_one();
    if (batch->files.empty()) return false;
    *number = taken_++;
    return true;
  }

  const Options options_;
  std::mutex listMutex_;
  fleet::FileList list_;
  size_t batchSize_;

  std::mutex mutex_;  // of all below
  std::condition_variable isMade_, isWanted_;
  std::vector<std::unique_ptr<Batch>> made_;  // by number, in a circle
  uint64_t taken_ = 0;
  uint64_t printed_ = 0;
  bool listEnded_ = false;
  bool stopped_ = false;
  bool failed_ = false;  // for want of memory
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

// As many as there are cores, and no more than there are descriptors for.
size_t ThreadCount(uint64_t jobs) {
  constexpr uint64_t kMost = 256;
  constexpr uint64_t kOtherDescriptors = 16;
  cpu_set_t cores;
  const bool known = sched_getaffinity(0, sizeof cores, &cores) == 0;
  uint64_t count = jobs > 0 ? jobs : known ? static_cast<uint64_t>(CPU_COUNT(&cores)) : 1;
  rlimit limit = {};
  if (getrlimit(RLIMIT_NOFILE, &limit) == 0) {
    count = std::min<uint64_t>(
        count, std::max<uint64_t>(limit.rlim_cur, kOtherDescriptors + 1) - kOtherDescriptors);
  }
  return static_cast<size_t>(std::clamp<uint64_t>(count, 1, kMost));
}

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

// Starts as many threads as can be had; without any the batches would not be made.
std::vector<std::thread> StartThreads(const std::shared_ptr<OrderedBatches> &batches,
                                      size_t count) {
  std::vector<std::thread> threads;
  try {
    while (threads.size() < count) threads.emplace_back([batches] { batches->Work(); });
  } catch (const std::system_error &) {
    if (threads.empty()) throw std::bad_alloc();
  }
  return threads;
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

// Prints the rows as they come. Returns the status of the dumps; nothing when the rows are not to
// their end, for a signal or because nobody takes them.
std::optional<Status> PrintRows(Output &output, OrderedBatches &batches, Progress &progress) {
  Status status = kGood;
  uint64_t dumps = 0;
  uint64_t faults = 0;
  while (StopSignals::Stopped() == 0) {
    std::unique_ptr<Batch> batch;
    auto got = batches.Next(&batch, milliseconds(0));
    if (got == OrderedBatches::Got::kNothingYet) {
      if (!output.Flush()) return std::nullopt;
      progress.Show(dumps, faults);
      got = batches.Next(&batch, milliseconds(50));
    }
    if (got == OrderedBatches::Got::kEnd) return status;
    if (got == OrderedBatches::Got::kNothingYet) continue;
    if (!output.Write(batch->rows)) return std::nullopt;
    dumps += batch->files.size();
    faults += batch->complaints.size();
    if (!batch->complaints.empty()) {
      progress.Clear();
      status = kBadData;
    }
    for (const auto &[file, fault] : batch->complaints) Complain(file, fault);
    if (batch->outOfMemory) RefuseMemory();
  }
  return std::nullopt;
}

Status PrintTable(const Options &options) {
  std::FILE *list = nullptr;
  if (!OpenList(options, &list)) return kBadUsage;
  const bool isPipe = IsPipe(list);
  const bool showProgress = isatty(STDERR_FILENO) != 0 && !OutputIsTerminal();
  std::optional<uint64_t> total;
  if (showProgress && !isPipe) total = CountFiles(options);
  StopSignals signals;
  Output output;
  PrintHeading(output, *options.selection);
  KeepThreadsSmall();
  const size_t count = ThreadCount(options.jobs);
  const auto batches = std::make_shared<OrderedBatches>(
      options, FilesOf(options, list), isPipe ? 1 : kBatchSize, count * kBatchesAhead);
  std::vector<std::thread> threads = StartThreads(batches, count);
  std::optional<Status> status;
  bool outOfMemory = false;
  try {
    Progress progress(showProgress, total);
    status = PrintRows(output, *batches, progress);
  } catch (const std::bad_alloc &) {
    outOfMemory = true;
  }
  batches->Stop();
  // One that reads a pipe may never come to its end.
  for (std::thread &thread : threads) status ? thread.join() : thread.detach();
  if (outOfMemory || batches->failed()) RefuseMemory();
  if (StopSignals::Stopped() != 0) {
    output.Flush();
    StopSignals::EndProcess();
  }
  if (status && batches->listError() != 0) {
    Complain(DisplayName(options.list), std::strerror(batches->listError()));
    status = kBadData;
  }
  return output.Finish(status.value_or(kBadData));
}

}  // namespace

void AddTable(CLI::App &app, Action *action) {
  CLI::App *command = app.add_subcommand("table", "Print many dumps as one table, a row each");
  const auto options = std::make_shared<Options>();
  command->add_option("FILE|FOLDER", options->files, "Dumps; a folder stands for all files in it")
      ->type_name("");
  AddStream(command, &options->stream);
  AddNames(command, &options->names);
  CLI::Option *list =
      command
          ->add_option("--files-from", options->list,
                       "Read names of dumps from this file, a line each; - for standard input")
          ->type_name("FILE");
  command->add_flag("-0", options->endedByNul, "Names in the list end with a NUL")->needs(list);
  AddNumber(command, "-j,--jobs", &options->jobs, 1, UINT32_MAX,
            "Threads; without it as many as there are cores");
  command->callback([=] {
    if (options->files.empty() && options->list.empty()) {
      throw CLI::ValidationError("FILE|FOLDER", "is needed, or --files-from");
    }
    if (options->list == "-" && std::ranges::count(options->files, "-") > 0) {
      throw CLI::ValidationError("--files-from", "standard input can be read only once");
    }
    options->selection = Select({&options->stream, 1}, options->names);
    *action = [=] { return PrintTable(*options); };
  });
}

}  // namespace tools
