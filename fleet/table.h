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

// One dump: a value for each column, with 1 in `present` when the dump has it.
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
  bool outOfMemory = false;     // some files are missing
};

class Table {
 public:
  // Starts to read. Throws std::bad_alloc when memory or all threads are refused.
  Table(const TableOptions &options, FileList list);
  // May be called before Next has returned kEnd. Threads are detached then: one may wait for a
  // pipe.
  ~Table();
  Table(const Table &) = delete;
  Table &operator=(const Table &) = delete;

  enum class Got { kBatch, kNothingYet, kEnd };

  // The next batch, in order, if it is ready in time.
  Got Next(std::unique_ptr<Batch> *batch, std::chrono::milliseconds time);

  // Why the list of names was not read to its end. Ask at the end.
  const std::string &listFault() const;
  // Whether the end came early because memory was refused.
  bool outOfMemory() const;

 private:
  class OrderedBatches;

  std::shared_ptr<OrderedBatches> batches_;
  std::vector<std::thread> threads_;
  bool ended_ = false;
};

}  // namespace fleet

#endif
