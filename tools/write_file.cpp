#include "tools/write_file.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <random>

#include "fleet/descriptor.h"
#include "tools/output.h"
#include "tools/text.h"

namespace tools {
namespace {

using fleet::Descriptor;
using fleet::WriteAll;
using std::filesystem::path;

constexpr int kMostLinks = 40;  // the kernel's own limit
constexpr std::string_view kTemporary = ".tmp-";
constexpr size_t kRandomLetters = 6;

// A name in a folder. The folder is held open, so that all steps happen in the same folder, even
// when it is renamed meanwhile.
struct Place {
  Descriptor folder;
  std::string name;
};

// Finds the folder and the name of a path. `from` is the folder that a relative path starts in.
// The functions that return an int return 0, or the error number as in errno.
int FindPlace(int from, const path &file, Place *place) {
  // The dot makes the kernel follow a link to a folder under its rules for links within a path.
  const path parent = file.parent_path() / ".";
  Descriptor folder(openat(from, parent.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
  if (!folder.isOpen()) return errno;
  place->folder = std::move(folder);
  place->name = file.filename().empty() ? "." : file.filename().native();
  return 0;
}

// The kernel's rule for open (fs.protected_symlinks). In a sticky folder that all can write to, a
// link is followed only when it belongs to us or to the owner of the folder.
bool MayFollow(const struct stat &folder, const struct stat &link) {
  const bool shared = (folder.st_mode & S_ISVTX) != 0 && (folder.st_mode & S_IWOTH) != 0;
  return !shared || link.st_uid == geteuid() || link.st_uid == folder.st_uid;
}

// The descriptor of this process that a link such as /proc/self/fd/1 means, if it means one. Its
// file is written through the descriptor and is not replaced.
std::optional<int> OwnDescriptor(const struct stat &folder, const std::string &name) {
  for (const char *own : {"/proc/self/fd", "/proc/thread-self/fd"}) {
    struct stat descriptors = {};
    if (stat(own, &descriptors) != 0 || descriptors.st_dev != folder.st_dev ||
        descriptors.st_ino != folder.st_ino) {
      continue;
    }
    const std::optional<int> number = ParseNumber(name, 0, INT_MAX);
    return number ? std::optional(OriginalDescriptor(*number)) : std::nullopt;
  }
  return std::nullopt;
}

// The place to write to, and how: replace a file there, or write directly.
struct Target {
  Place place;
  bool isFile = true;             // a regular file, or none yet: replace it
  std::optional<int> descriptor;  // write to this descriptor instead
};

// Follows all links of a path to the place to write to.
int FindTarget(const std::string &file, Target *target) {
  if (const int error = FindPlace(AT_FDCWD, file, &target->place)) return error;
  for (int links = 0;; ++links) {
    const Place &place = target->place;
    const Descriptor entry(
        openat(place.folder.number(), place.name.c_str(), O_PATH | O_NOFOLLOW | O_CLOEXEC));
    if (!entry.isOpen()) return errno == ENOENT ? 0 : errno;
    struct stat folder = {}, status = {};
    if (fstat(place.folder.number(), &folder) != 0) return errno;
    if (fstat(entry.number(), &status) != 0) return errno;
    if (!S_ISLNK(status.st_mode)) {
      target->isFile = S_ISREG(status.st_mode);
      return 0;
    }
    target->descriptor = OwnDescriptor(folder, place.name);
    if (target->descriptor) return 0;
    if (links == kMostLinks) return ELOOP;
    if (!MayFollow(folder, status)) return EACCES;
    std::array<char, PATH_MAX> text;
    const ssize_t length = readlinkat(entry.number(), "", text.data(), text.size());
    if (length < 0) return errno;
    const path leadsTo = std::string_view(text.data(), static_cast<size_t>(length));
    if (const int error = FindPlace(place.folder.number(), leadsTo, &target->place)) return error;
  }
}

// A name for a temporary file, which nobody can guess.
std::string TemporaryName(const std::string &name) {
  constexpr std::string_view kLetters = "abcdefghijklmnopqrstuvwxyz234567";
  std::random_device random;
  std::string temporary = name.substr(0, NAME_MAX - kTemporary.size() - kRandomLetters);
  temporary += kTemporary;
  for (size_t i = 0; i < kRandomLetters; ++i) temporary += kLetters[random() % kLetters.size()];
  return temporary;
}

// Writes a file under a temporary name, then renames it.
int Replace(const Place &place, const std::string &temporary, std::string_view bytes,
            std::optional<mode_t> mode) {
  const int folder = place.folder.number();
  Descriptor file(openat(folder, temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
  if (!file.isOpen()) return errno;
  const mode_t mask = umask(0);
  umask(mask);
  const bool replaced = WriteAll(file.number(), bytes) == 0 &&
                        fchmod(file.number(), mode.value_or(0666 & ~mask)) == 0 &&
                        fsync(file.number()) == 0 && file.Close() == 0 &&
                        renameat(folder, temporary.c_str(), folder, place.name.c_str()) == 0;
  if (replaced) return 0;
  const int error = errno;
  unlinkat(folder, temporary.c_str(), 0);
  return error;
}

// Writes to a device or a pipe.
int WriteThrough(const Place &place, std::string_view bytes) {
  const Descriptor device(openat(place.folder.number(), place.name.c_str(),
                                 O_WRONLY | O_NOFOLLOW | O_NOCTTY | O_CLOEXEC));
  if (!device.isOpen()) return errno;
  struct stat status = {};
  if (fstat(device.number(), &status) != 0) return errno;
  // A file has taken its place meanwhile. Writing into it would leave its old end in place.
  if (S_ISREG(status.st_mode)) return EBUSY;
  return WriteAll(device.number(), bytes);
}

int WriteTarget(const std::string &file, std::string_view bytes, std::optional<mode_t> mode) {
  Target target;
  if (const int error = FindTarget(file, &target)) return error;
  if (target.descriptor) return WriteAll(*target.descriptor, bytes);
  if (!target.isFile) return WriteThrough(target.place, bytes);
  const std::string temporary = TemporaryName(target.place.name);
  // Signals wait meanwhile. So one that ends the command leaves no temporary file.
  sigset_t all, before;
  sigfillset(&all);
  sigprocmask(SIG_BLOCK, &all, &before);
  const int error = Replace(target.place, temporary, bytes, mode);
  sigprocmask(SIG_SETMASK, &before, nullptr);
  return error;
}

}  // namespace

Status WriteWhole(std::string_view bytes, const std::string &file, Status status,
                  std::optional<mode_t> mode) {
  if (file.empty()) {
    Output output;
    output.Write(bytes);
    return output.Finish(status);
  }
  const int error = WriteTarget(file, bytes, mode);
  if (error == 0) return status;
  Complain(file, std::strerror(error));
  return kBadData;
}

}  // namespace tools
