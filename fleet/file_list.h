// The files of a fleet, one after the other.
#ifndef FLEET_FILE_LIST_H
#define FLEET_FILE_LIST_H

#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

namespace fleet {

// A file that was named, or found in a folder.
struct ListedFile {
  std::string name;
  bool inFolder = false;
  std::string fault;  // why a folder cannot be read; later the fault of a dump
};

// Returns the files that names stand for, in the order of the names. A folder stands for all files
// in it and below, in byte order of their paths; links are followed. Memory holds only the names in
// one folder and in the folders above it. Throws std::bad_alloc.
class FileList {
 public:
  // Names from a list, if there is one, come after the others; each ends with `end`. Empty names
  // are passed over, and "-" is a file with that name. The stream is closed at the end.
  explicit FileList(std::vector<std::string> names, std::FILE *list = nullptr, char end = '\n');

  // False after the last one.
  bool Next(ListedFile *file);

  // Why the list was not read to its end; empty when it was.
  const std::string &listFault() const { return listFault_; }

 private:
  // A folder whose files are being returned.
  struct Folder {
    std::string path;                // with a slash at its end
    std::vector<std::string> names;  // that are left, the next one at the end
    uint64_t device = 0;
    uint64_t inode = 0;
  };

  bool NextName(std::string *name);
  std::string Enter(const std::string &path);

  std::vector<std::string> names_;
  size_t next_ = 0;
  std::unique_ptr<std::FILE, int (*)(std::FILE *)> list_;
  char end_;
  std::string listFault_;
  std::vector<Folder> folders_;
};

}  // namespace fleet

#endif
