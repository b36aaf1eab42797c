// The files of a fleet, one after the other.

#include "fleet/file_list.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <system_error>
#include <utility>

namespace fleet {
namespace {

bool IsFolder(const std::string &path) {
  struct stat status = {};
  return stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

// The names in a folder, those of folders with a slash at their end: so they are sorted as the
// paths of what is in them are. Returns the number of the error.
int ListFolder(const std::string &path, std::vector<std::string> *names) {
  std::error_code error;
  for (std::filesystem::directory_iterator entry(path, error), end; entry != end;
       entry.increment(error)) {
    std::error_code unclear;
    const bool isFolder = entry->is_directory(unclear);
    names->push_back(entry->path().filename().string() + (isFolder ? "/" : ""));
  }
  std::ranges::sort(*names);  // strings compare by bytes, whatever the language
  return error.value();
}

}  // namespace

FileList::FileList(std::vector<std::string> names, std::FILE *list, char end)
    : names_(std::move(names)), list_(list), end_(end) {}

bool FileList::Next(ListedFile *file) {
  *file = {};
  for (;;) {
    while (!folders_.empty()) {
      if (folders_.back().next == folders_.back().names.size()) {
        folders_.pop_back();
      } else if (NextInFolder(file)) {
        return true;
      }
    }
    std::string name;
    if (!NextName(&name)) return false;
    if (!IsFolder(name)) {
      file->name = std::move(name);
      return true;
    }
    if (Enter(name.ends_with('/') ? name : name + '/', file)) return true;
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
      error_ = errno;
      list_.reset();
      break;
    }
    *name = {line, static_cast<size_t>(length)};
    if (name->back() == end_) name->pop_back();
    if (!name->empty()) return true;
  }
  return false;
}

// Begins to go through a folder. True when that cannot be done, which `file` tells.
bool FileList::Enter(const std::string &path, ListedFile *file) {
  const auto refuse = [&](const std::string &fault) {
    *file = {path, true, fault};
    return true;
  };
  struct stat status = {};
  if (stat(path.c_str(), &status) != 0) return refuse(std::strerror(errno));
  const bool isAbove = std::ranges::any_of(folders_, [&](const Folder &folder) {
    return folder.device == status.st_dev && folder.inode == status.st_ino;
  });
  if (isAbove) return refuse("a link back to a folder that it is in");
  Folder folder = {path, {}, 0, status.st_dev, status.st_ino};
  const int error = ListFolder(path, &folder.names);
  folders_.push_back(std::move(folder));
  return error != 0 && refuse(std::strerror(error));
}

// The next file of the innermost folder, or the fault of a folder in it. False when a folder was
// begun instead.
bool FileList::NextInFolder(ListedFile *file) {
  Folder &folder = folders_.back();
  const std::string path = folder.path + folder.names[folder.next++];
  if (path.ends_with('/')) return Enter(path, file);
  *file = {path, true, ""};
  return true;
}

}  // namespace fleet
