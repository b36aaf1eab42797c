// The files of a fleet, one after the other.
#ifndef FLEET_FILE_LIST_H
#define FLEET_FILE_LIST_H

#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

namespace fleet {

// A file, or a folder that cannot be read.
struct ListedFile {
  std::string name;
  bool inFolder = false;  // found in a folder, not named by the user
  std::string fault;      // why a folder cannot be read; later the fault of a dump
};

// Returns the files that names stand for, in the order of the names. A folder stands for all files
// in it and below, in byte order of their paths; links are followed. Memory holds only the names in
// one folder and in the folders above it. Throws std::bad_alloc.
class FileList {
 public:
  // Names read from `list`, if it is not null, come after `names`; each ends with `end`. There,
  // empty names are passed over, and "-" is a file with that name. FileList closes `list`.
  explicit FileList(std::vector<std::string> names, std::FILE *list = nullptr, char end = '\n');

  // False after the last one.
  bool Next(ListedFile *file);

  // Why the list was not read to its end; empty when it was.
  const std::string &listFault() const { return listFault_; }

 private:
  // A folder whose files are being returned.
  struct Folder {
    std::string path;                // with a slash at its end
    std::vector<std::string> names;  // those not returned yet, the next one at the end
    uint64_t device = 0;
    uint64_t inode = 0;
  };

  bool NextName(std::string *name);  // of names_, then of list_; false after the last one
  std::string Enter(const std::string &path);

  std::vector<std::string> names_;
  size_t next_ = 0;  // index in names_
  std::unique_ptr<std::FILE, int (*)(std::FILE *)> list_;
  char end_;
  std::string listFault_;
  std::vector<Folder> folders_;
};

}  // namespace fleet

#endif
