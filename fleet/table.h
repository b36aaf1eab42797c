// Many dumps as one table: several threads make the rows, which are handed out in the order of the
// files.
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

// What is known of one dump: a value for each column, and 1 in `present` where the dump has it.
struct Row {
  const ListedFile &file;  // with the dump's fault, empty for a good one
  std::span<const uint64_t> values;
  std::span<const uint8_t> present;
};

struct TableOptions {
  MorwickStream stream = kMorwickKVR;
  std::shared_ptr<const Selection> selection = nullptr;
  uint64_t jobs = 0;  // threads; 0 for as many as there are cores
  // Puts a row after those that were made before, in the form in which they are wanted.
  void (*appendRow)(const Row &row, std::string *rows) = nullptr;
  size_t batchSize = 16;  // dumps that a thread takes at once
};

// Some files in a row with the faults of their dumps, and their rows.
struct Batch {
  std::vector<ListedFile> files;
  std::string rows;
  bool outOfMemory = false;  // those that are missing
};

class Table {
 public:
  // Begins to read. Throws std::bad_alloc when there is no memory or no thread to be had.
  Table(const TableOptions &options, FileList list);
  // Ends before the last batch was taken too. A thread that waits for a pipe is left to itself.
  ~Table();
  Table(const Table &) = delete;
  Table &operator=(const Table &) = delete;

  enum class Got { kBatch, kNothingYet, kEnd };

  // The next batch in turn, if it comes in time.
  Got Next(std::unique_ptr<Batch> *batch, std::chrono::milliseconds time);

  // Why the list could not be read to its end, as in errno; known at the end.
  int listError() const;
  // Whether the end came early for want of memory.
  bool outOfMemory() const;

 private:
  class OrderedBatches;

  std::shared_ptr<OrderedBatches> batches_;
  std::vector<std::thread> threads_;
  bool ended_ = false;
};

}  // namespace fleet

#endif
