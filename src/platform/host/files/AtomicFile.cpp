#include "platform/host/files/AtomicFile.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <utility>

namespace vesprun {
namespace {

constexpr mode_t kOwnerOnly = 0600;
constexpr std::size_t kWrittenPiece = 64 * 1024;
constexpr int kMostUnfinished = 100;

bool sync(const FileDescriptor& folder, const std::string& path, std::string& error) {
  const bool synced = folder.isOpen() && fsync(folder.get()) == 0;
  if (!synced) {
    error = systemError(path);
  }
  return synced;
}

}  // namespace

AtomicFile::~AtomicFile() {
  if (_folderDescriptor.isOpen() && !_unfinishedName.empty()) {
    unlinkat(_folderDescriptor.get(), _unfinishedName.c_str(), 0);
  }
}

std::optional<AtomicFile> AtomicFile::create(const std::string& folder, std::string& error) {
  AtomicFile file(folder, openFolder(folder));
  if (!file._folderDescriptor.isOpen()) {
    error = systemError(folder);
    return std::nullopt;
  }
  if (!file.openUnfinished(error)) {
    return std::nullopt;
  }
  if (fchmod(file._file.get(), kOwnerOnly) != 0) {  // whatever the umask
    error = systemError(folder);
    return std::nullopt;
  }
  return file;
}

bool AtomicFile::openUnfinished(std::string& error) {
  for (int number = 1; number <= kMostUnfinished; ++number) {
    const std::string name = ".unfinished-" + std::to_string(number);
    FileDescriptor file(openat(_folderDescriptor.get(), name.c_str(),
                               O_CREAT | O_WRONLY | O_CLOEXEC | O_NOFOLLOW, kOwnerOnly));
    if (!file.isOpen()) {
      error = systemError(pathOf(name));
      return false;
    }
    // Its writer holds the lock while it lives; a file without one is left from a kill and
    // overwritten. Between open and lock the name may have gone to another file.
    struct stat opened {};
    struct stat named {};
    if (flock(file.get(), LOCK_EX | LOCK_NB) != 0 || fstat(file.get(), &opened) != 0 ||
        fstatat(_folderDescriptor.get(), name.c_str(), &named, AT_SYMLINK_NOFOLLOW) != 0 ||
        opened.st_ino != named.st_ino) {
      continue;
    }
    if (opened.st_nlink != 1) {  // killed after the document got its name
      unlinkat(_folderDescriptor.get(), name.c_str(), 0);
      continue;
    }
    if (ftruncate(file.get(), 0) != 0) {
      error = systemError(pathOf(name));
      return false;
    }
    _file = std::move(file);
    _unfinishedName = name;
    return true;
  }
  error = _folder + ": too many documents are being written";
  return false;
}

void AtomicFile::takeAccessOf(const struct stat& folder) {
  constexpr mode_t kReadAndWrite = 0666;
  constexpr mode_t kWithoutGroup = 0606;
  struct stat own {};
  const bool isGiven = fchown(_file.get(), folder.st_uid, folder.st_gid) == 0 ||
                       (fstat(_file.get(), &own) == 0 && own.st_gid == folder.st_gid);
  if (fchmod(_file.get(), folder.st_mode & (isGiven ? kReadAndWrite : kWithoutGroup)) != 0 &&
      _failure.empty()) {
    _failure = std::strerror(errno);
  }
}

bool AtomicFile::append(std::string_view bytes) {
  if (!_failure.empty()) {
    return false;
  }
  if (_pending.size() + bytes.size() < kWrittenPiece) {
    _pending += bytes;
    return true;
  }
  return writeOut(std::exchange(_pending, {})) && writeOut(bytes);
}

bool AtomicFile::writeOut(std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t written = write(_file.get(), bytes.data(), bytes.size());
    if (written < 0 && errno == EINTR) {
      continue;
    }
    if (written <= 0) {
      _failure = written == 0 ? "nothing could be written" : std::strerror(errno);
      return false;
    }
    bytes.remove_prefix(static_cast<std::size_t>(written));
  }
  return true;
}

bool AtomicFile::makeDurable(const std::string& name, std::string& error) {
  if (_failure.empty() && writeOut(std::exchange(_pending, {}))) {
    if (_modified) {
      const timespec times[] = {{0, UTIME_OMIT}, {_modified->seconds, _modified->nanoseconds}};
      static_cast<void>(futimens(_file.get(), times));  // a document is worth more than its age
    }
    if (fsync(_file.get()) != 0) {
      _failure = std::strerror(errno);
    }
  }
  if (!_failure.empty()) {
    error = pathOf(name) + ": " + _failure;
  }
  return _failure.empty();
}

bool AtomicFile::replace(const std::string& name, std::string& error) {
  if (!makeDurable(name, error)) {
    return false;
  }
  const int folder = _folderDescriptor.get();
  if (renameat(folder, _unfinishedName.c_str(), folder, name.c_str()) != 0) {
    error = systemError(pathOf(name));
    return false;
  }
  _unfinishedName.clear();
  return sync(_folderDescriptor, _folder, error);
}

AtomicFile::Added AtomicFile::addNew(const std::string& name, std::string& error) {
  if (!makeDurable(name, error)) {
    return Added::Failed;
  }
  // Linked: a rename would replace a file of that name.
  const int folder = _folderDescriptor.get();
  if (linkat(folder, _unfinishedName.c_str(), folder, name.c_str(), 0) != 0) {
    if (errno == EEXIST) {
      return Added::NameTaken;
    }
    error = systemError(pathOf(name));
    return Added::Failed;
  }
  unlinkat(folder, std::exchange(_unfinishedName, {}).c_str(), 0);
  if (!sync(_folderDescriptor, _folder, error)) {
    unlinkat(folder, name.c_str(), 0);
    return Added::Failed;
  }
  return Added::Done;
}

bool replaceFile(const std::string& path, std::string_view content, std::string& error) {
  const auto slash = path.rfind('/');
  const std::string folder =
      slash == std::string::npos ? "." : path.substr(0, slash == 0 ? 1 : slash);
  std::optional<AtomicFile> file = AtomicFile::create(folder, error);
  if (!file) {
    return false;
  }
  file->append(content);
  return file->replace(path.substr(slash + 1), error);
}

bool flushFolder(const std::string& folder, std::string& error) {
  return sync(openFolder(folder), folder, error);
}

}  // namespace vesprun
