// Many dumps as one table.

#include "fleet/table.h"

#include <sched.h>
#include <sys/resource.h>

#include <algorithm>
#include <condition_variable>
#include <mutex>
#include <new>
#include <optional>
#include <utility>

#include "fleet/dump.h"

namespace fleet {
namespace {

constexpr uint64_t kBatchesAhead = 8;  // that each thread may make before one is handed out

// Makes rows. Each thread has its own.
class RowMaker {
 public:
  explicit RowMaker(const TableOptions &options)
      : appendRow_(options.appendRow),
        filler_(options.stream, *options.selection),
        values_(options.selection->columns().size()),
        present_(values_.size()) {}

  void Make(Batch *batch) {
    for (size_t i = 0; i < batch->files.size(); ++i) {
      const size_t before = batch->rows.size();
      try {
        std::ranges::fill(present_, 0);
        ListedFile &file = batch->files[i];
        if (file.fault.empty()) file.fault = Read(file);
        appendRow_({file, values_, present_}, &batch->rows);
        batch->rowEnds.push_back(batch->rows.size());
      } catch (const std::bad_alloc &) {
        batch->rows.resize(before);
        batch->files.resize(i);  // ends the loop
        batch->outOfMemory = true;
      }
    }
  }

 private:
  // Reads the values of a dump, and returns its fault.
  std::string Read(const ListedFile &file) {
    const DumpReader::Dump dump = reader_.Read(file.name.c_str(), file.inFolder);
    if (!dump.fault.empty() && dump.bytes.empty()) return dump.fault;
    const Verdict verdict = filler_.Fill(dump.bytes, values_, present_);
    // When bytes are missing, the place where the statistics end means nothing.
    return dump.fault.empty() ? verdict.Fault() : dump.fault;
  }

  void (*appendRow_)(const Row &row, std::string *rows);
  DumpReader reader_;
  ColumnFiller filler_;
  std::vector<uint64_t> values_;
  std::vector<uint8_t> present_;
};

// As many as `jobs`, or as there are cores, but not more than there are descriptors.
size_t ThreadCount(uint64_t jobs) {
  constexpr uint64_t kMost = 32;  // dumps of the largest size fit into the command's 1 GiB
  constexpr uint64_t kOtherDescriptors = 16;
  cpu_set_t cores;
  const bool coresKnown = sched_getaffinity(0, sizeof cores, &cores) == 0;
  uint64_t count = jobs > 0 ? jobs : coresKnown ? static_cast<uint64_t>(CPU_COUNT(&cores)) : 1;
  rlimit limit = {};
  if (getrlimit(RLIMIT_NOFILE, &limit) == 0) {
    count = std::min<uint64_t>(
        count, std::max<uint64_t>(limit.rlim_cur, kOtherDescriptors + 1) - kOtherDescriptors);
  }
  return static_cast<size_t>(std::clamp<uint64_t>(count, 1, kMost));
}

}  // namespace

// Several threads make batches, which are handed out in the order of their files.
class Table::OrderedBatches {
 public:
  // Threads make at most `ahead` batches before the first of them is handed out.
  OrderedBatches(TableOptions options, FileList list, size_t ahead)
      : options_(std::move(options)), list_(std::move(list)), made_(ahead) {}

  // The work of one thread.
  void Work() {
    std::optional<RowMaker> maker;
    for (;;) {
      uint64_t number = 0;
      std::unique_ptr<Batch> batch;
      try {
        batch = std::make_unique<Batch>();
        if (!maker) maker.emplace(options_);
        if (!TakeFiles(batch.get(), &number)) return;
      } catch (const std::bad_alloc &) {
        return Stop(true);
      }
      maker->Make(batch.get());
      const std::lock_guard lock(mutex_);
      made_[number % made_.size()] = std::move(batch);
      isMade_.notify_one();
    }
  }

  Got Next(std::unique_ptr<Batch> *batch, std::chrono::milliseconds time) {
    std::unique_lock lock(mutex_);
    std::unique_ptr<Batch> &next = made_[handedOut_ % made_.size()];
    isMade_.wait_for(lock, time, [&] { return next != nullptr || AtEnd(); });
    if (next == nullptr) return AtEnd() ? Got::kEnd : Got::kNothingYet;
    *batch = std::move(next);
    ++handedOut_;
    isWanted_.notify_all();
    return Got::kBatch;
  }

  // Makes the threads end. After a failure Next returns kEnd, too.
  void Stop(bool failed) {
    const std::lock_guard lock(mutex_);
    stopped_ = true;
    failed_ = failed_ || failed;
    isMade_.notify_one();
    isWanted_.notify_all();
  }

  const std::string &listFault() const { return list_.listFault(); }
  bool failed() const { return failed_; }

 private:
  bool AtEnd() const { return failed_ || (listEnded_ && handedOut_ == begun_); }

  // Takes the next files. False when there are none, or the threads must end.
  bool TakeFiles(Batch *batch, uint64_t *number) {
    // The list has a lock of its own, so that batches are handed out while it is read.
    const std::lock_guard listLock(listMutex_);
    {
      std::unique_lock lock(mutex_);
      isWanted_.wait(lock, [&] { return stopped_ || begun_ < handedOut_ + made_.size(); });
      if (stopped_ || listEnded_) return false;
    }
    try {
      for (ListedFile file; batch->files.size() < options_.batchSize && list_.Next(&file);) {
        batch->files.push_back(std::move(file));
      }
    } catch (const std::bad_alloc &) {
      Stop(true);  // before the list is unlocked: another thread would go on after the lost names
      return false;
    }
    const std::lock_guard lock(mutex_);
    listEnded_ = batch->files.size() < options_.batchSize;
    if (listEnded_) isMade_.notify_one();
    if (batch->files.empty()) return false;
    *number = begun_++;
    return true;
  }

  const TableOptions options_;
  std::mutex listMutex_;
  FileList list_;

  std::mutex mutex_;  // guards all members below
  std::condition_variable isMade_, isWanted_;
  std::vector<std::unique_ptr<Batch>> made_;  // a circle: by number modulo its size
  uint64_t begun_ = 0;                        // batches whose files a thread has taken
  uint64_t handedOut_ = 0;                    // batches that Next has returned
  bool listEnded_ = false;
  bool stopped_ = false;
  bool failed_ = false;  // memory was refused
};

Table::Table(const TableOptions &options, FileList list) {
  const size_t count = ThreadCount(options.jobs);
  batches_ = std::make_shared<OrderedBatches>(options, std::move(list), count * kBatchesAhead);
  threads_.reserve(count);
  try {
    while (threads_.size() < count) threads_.emplace_back([all = batches_] { all->Work(); });
  } catch (const std::exception &) {  // no thread, or no memory for it
    if (threads_.empty()) throw std::bad_alloc();
  }
}

Table::~Table() {
  batches_->Stop(false);
  for (std::thread &thread : threads_) ended_ ? thread.join() : thread.detach();
}

Table::Got Table::Next(std::unique_ptr<Batch> *batch, std::chrono::milliseconds time) {
  const Got got = batches_->Next(batch, time);
  ended_ = got == Got::kEnd;
  return got;
}

const std::string &Table::listFault() const { return batches_->listFault(); }

bool Table::outOfMemory() const { return batches_->failed(); }

}  // namespace fleet
