#include "platform/host/files/AtomicFile.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <utility>

#include "common/TextForm.h"

namespace vesprun {
namespace {

constexpr mode_t kOwnerOnly = 0600;
constexpr std::size_t kWrittenPiece = 64 * 1024;
constexpr std::string_view kUnfinished = ".unfinished-";

/// A name that nobody can have taken before.
std::string unfinishedName() {
  std::array<std::uint8_t, 8> random{};
  return getrandom(random.data(), random.size(), 0) == static_cast<ssize_t>(random.size())
             ? std::string(kUnfinished) + hexadecimalText(random)
             : "";
}

bool sync(const FileDescriptor& file, const std::string& path, std::string& error) {
  const bool synced = file.isOpen() && fsync(file.get()) == 0;
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

std::optional<AtomicFile> AtomicFile::create(const HostPath& folder, std::string& error) {
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
  constexpr int kMaxAttempts = 10;
  for (int attempt = 0; attempt < kMaxAttempts; ++attempt) {
    std::string name = unfinishedName();
    FileDescriptor file(openat(_folderDescriptor.get(), name.c_str(),
                               O_CREAT | O_EXCL | O_WRONLY | O_CLOEXEC, kOwnerOnly));
    if (!file.isOpen()) {
      error = systemError(_folder);
      return false;
    }
    // Its writer holds the lock while it lives. Before it has the lock, someone may take the file
    // for a left-over.
    struct stat opened {};
    if (flock(file.get(), LOCK_EX | LOCK_NB) == 0 && fstat(file.get(), &opened) == 0 &&
        opened.st_nlink != 0) {
      _file = std::move(file);
      _unfinishedName = std::move(name);  // a copy could fail, and leave the file
      return true;
    }
    unlinkat(_folderDescriptor.get(), name.c_str(), 0);
  }
  error = systemError(_folder);
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
  removeLeftOvers(_folder);
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

void removeLeftOvers(const HostPath& folder) {
  std::string ignored;
  for (const std::string& name :
       namesInFolder(folder, ignored).value_or(std::vector<std::string>())) {
    if (!name.starts_with(kUnfinished)) {
      continue;
    }
    const HostPath path = folder.below(name);
    const FileDescriptor file = path.open(O_RDONLY | O_NONBLOCK);
    struct stat status {};
    if (file.isOpen() && fstat(file.get(), &status) == 0 && S_ISREG(status.st_mode) &&
        status.st_uid == geteuid() && flock(file.get(), LOCK_EX | LOCK_NB) == 0) {
      removeFile(path);
    }
  }
}

bool replaceFile(const HostPath& path, std::string_view content, std::string& error) {
  std::optional<AtomicFile> file = AtomicFile::create(path.folder(), error);
  if (!file) {
    return false;
  }
  file->append(content);
  return file->replace(path.name(), error);
}

bool flushFile(const HostPath& path, std::string& error) {
  return sync(path.open(O_RDONLY | O_NONBLOCK), path, error) && flushFolder(path.folder(), error);
}

bool flushFolder(const HostPath& folder, std::string& error) {
  return sync(openFolder(folder), folder, error);
}

}  // namespace vesprun
