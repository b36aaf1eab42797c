#include "fleet/file_list.h"

#include <dirent.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <new>
#include <utility>

namespace fleet {
namespace {

bool IsFolder(const std::string &path) {
  struct stat status = {};
  return stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

// The error number in words. Throws when memory was refused, which is no fault of a file.
std::string FaultOf(int error) {
  if (error == ENOMEM) throw std::bad_alloc();
  return std::strerror(error);
}

// Lists the names in a folder in descending byte order, since the next one is taken from the end.
// Names of folders end with a slash, so that they sort like the paths of their files. Returns the
// error number as in errno.
int ListFolder(const std::string &path, std::vector<std::string> *names) {
  const std::unique_ptr<DIR, int (*)(DIR *)> folder(opendir(path.c_str()), closedir);
  if (folder == nullptr) return errno;
  errno = 0;
  while (const dirent *entry = readdir(folder.get())) {
    std::string name = entry->d_name;
    if (name == "." || name == "..") continue;
    const bool isUnclear = entry->d_type == DT_LNK || entry->d_type == DT_UNKNOWN;
    if (isUnclear ? IsFolder(path + name) : entry->d_type == DT_DIR) name += '/';
    names->push_back(std::move(name));
    errno = 0;
  }
  const int error = errno;
  std::ranges::sort(*names, std::greater());
  return error;
}

}  // namespace

FileList::FileList(std::vector<std::string> names, std::FILE *list, char end)
    : names_(std::move(names)), list_(list, std::fclose), end_(end) {}

bool FileList::Next(ListedFile *file) {
  for (;;) {
    *file = {};
    if (folders_.empty()) {
      if (!NextName(&file->name)) return false;
      if (!IsFolder(file->name)) return true;
      if (!file->name.ends_with('/')) file->name += '/';
    } else if (Folder &folder = folders_.back(); folder.names.empty()) {
      folders_.pop_back();
      continue;
    } else {
      file->name = folder.path + folder.names.back();
      folder.names.pop_back();
    }
    file->inFolder = true;
    if (!file->name.ends_with('/')) return true;
    file->fault = Enter(file->name);
    if (!file->fault.empty()) return true;
  }
}

bool FileList::NextName(std::string *name) {
  if (next_ < names_.size()) {
    *name = std::move(names_[next_++]);
    return true;
  }
  while (list_ != nullptr) {
    char *line = nullptr;
    size_t room = 0;
    errno = 0;
    const ssize_t length = getdelim(&line, &room, end_, list_.get());
    const std::unique_ptr<char, void (*)(void *)> owned(line, std::free);
    if (length <= 0) {
      if (errno != 0) listFault_ = FaultOf(errno);
      list_.reset();
      break;
    }
    *name = {line, static_cast<size_t>(length)};
    if (name->back() == end_) name->pop_back();
    if (name->find('\0') != std::string::npos) {
      listFault_ = "a line contains a NUL; use -0 when each name ends with one";
      list_.reset();
      break;
    }
    if (*name == "-") *name = "./-";
    if (!name->empty()) return true;
  }
  return false;
}

// Starts to return the files of a folder. Returns why it cannot be read; empty when it can.
std::string FileList::Enter(const std::string &path) {
  struct stat status = {};
  if (stat(path.c_str(), &status) != 0) return FaultOf(errno);
  const bool isAbove = std::ranges::any_of(folders_, [&](const Folder &folder) {
    return folder.device == status.st_dev && folder.inode == status.st_ino;
  });
  if (isAbove) return "a link back to a folder that contains it";
  Folder folder = {path, {}, status.st_dev, status.st_ino};
  if (const int error = ListFolder(path, &folder.names); error != 0) return FaultOf(error);
  folders_.push_back(std::move(folder));
  return "";
}

}  // namespace fleet
