// Many dumps as one table. Several threads make the rows, which come in the order of the files.
#ifndef FLEET_TABLE_H
#define FLEET_TABLE_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <thread>
#include <vector>

#include "fleet/columns.h"
#include "fleet/file_list.h"

namespace fleet {

// The row of one file. `values` has an element for each column; it counts only where `present`
// has 1.
struct Row {
  const ListedFile &file;  // with the dump's fault, empty for a good one
  std::span<const uint64_t> values;
  std::span<const uint8_t> present;
};

struct TableOptions {
  MorwickStream stream = kMorwickKVR;
  std::shared_ptr<const Selection> selection = nullptr;
  uint64_t jobs = 0;  // threads; 0 for as many as there are cores
  // Appends a row to the rows, in the form that the caller wants.
  void (*appendRow)(const Row &row, std::string *rows) = nullptr;
  size_t batchSize = 16;  // dumps that a thread takes at once
};

// Consecutive files with the faults of their dumps, and their rows.
struct Batch {
  std::vector<ListedFile> files;
  std::string rows;
  std::vector<size_t> rowEnds;  // where the row of each file ends in `rows`
  bool outOfMemory = false;     // memory was refused: the last files of this batch are missing
};

class Table {
 public:
  // Starts to read. Fewer threads than wanted are enough. Throws std::bad_alloc when memory is
  // refused or no thread can be started.
  Table(const TableOptions &options, FileList list);
  // Waits for the threads only when Next has returned kEnd. Before that it leaves them to end by
  // themselves, because one may be stuck reading a pipe.
  ~Table();
  Table(const Table &) = delete;
  Table &operator=(const Table &) = delete;

  enum class Got { kBatch, kNothingYet, kEnd };

  // The next batch, in order, if it is ready in time.
  Got Next(std::unique_ptr<Batch> *batch, std::chrono::milliseconds time);

  // Why the list of names was not read to its end. Valid after Next has returned kEnd.
  const std::string &listFault() const;
  // Whether Next returned kEnd early, because memory was refused outside the rows of a batch.
  bool outOfMemory() const;

 private:
  class OrderedBatches;

  std::shared_ptr<OrderedBatches> batches_;
  std::vector<std::thread> threads_;
  bool ended_ = false;
};

}  // namespace fleet

#endif
