#include "platform/host/files/JsonLines.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <utility>

#include "platform/host/files/AtomicFile.h"

namespace vesprun {

bool JsonLines::open(std::string& error, int creating) {
  // Opened for reading as well, to see how the last line ends, and without blocking, in case of a
  // pipe. A link could lead out of the device.
  FileDescriptor file(::open(
      _path.c_str(), O_RDWR | O_APPEND | O_CLOEXEC | O_NONBLOCK | O_NOFOLLOW | creating, 0600));
  struct stat status {};
  if (!file.isOpen() || fstat(file.get(), &status) != 0 ||
      ((status.st_mode & 0777) != 0600 && fchmod(file.get(), 0600) != 0)) {
    error = errno == ELOOP ? _path + ": a symbolic link" : systemError(_path);
    return false;
  }
  if (!S_ISREG(status.st_mode)) {
    error = _path + ": not a regular file";
    return false;
  }
  _file = std::move(file);
  return true;
}

bool JsonLines::append(std::string line, std::string& error) {
  if (line.find('\n') != std::string::npos) {
    error = _path + ": a line cannot hold a line feed";
    return false;
  }
  const std::scoped_lock guard(_mutex);
  if (!lock(error, O_CREAT)) {
    return false;
  }
  const bool appended = appendLocked(std::move(line), error);
  flock(_file.get(), LOCK_UN);
  return appended;
}

std::optional<std::uint64_t> JsonLines::remove(
    const std::function<bool(std::string_view line)>& goes, std::string& error) {
  const std::scoped_lock guard(_mutex);
  errno = 0;
  if (!lock(error, 0)) {
    return errno == ENOENT ? std::optional<std::uint64_t>(0) : std::nullopt;
  }
  const std::optional<std::uint64_t> removed = removeLocked(goes, error);
  flock(_file.get(), LOCK_UN);
  return removed;
}

bool JsonLines::flush(std::string& error) {
  const std::scoped_lock guard(_mutex);
  if (!isNamed() || fsync(_file.get()) != 0) {
    error = systemError(_path);
    return false;
  }
  return flushFolder(std::filesystem::path(_path).parent_path(), error);
}

bool JsonLines::lock(std::string& error, int creating) {
  // A file that was deleted or replaced meanwhile would take the line with it. While it is locked,
  // nobody replaces it.
  do {
    if (!isNamed() && !open(error, creating)) {
      return false;
    }
    const bool locked = takeLock(_file.get(), LOCK_EX, _wait, _path, error);
    // Only one line waits for whoever keeps the file; the others would together wait for ever.
    _wait = locked ? _longestWait : std::chrono::milliseconds::zero();
    if (!locked) {
      return false;
    }
  } while (!isNamed());
  return true;
}

bool JsonLines::isNamed() const {
  struct stat status {};
  return _file.isOpen() && fstat(_file.get(), &status) == 0 && status.st_nlink != 0;
}

bool JsonLines::appendLocked(std::string line, std::string& error) {
  struct stat before {};
  if (fstat(_file.get(), &before) != 0) {
    error = systemError(_path);
    return false;
  }
  char last = '\n';
  const bool torn =
      before.st_size > 0 && pread(_file.get(), &last, 1, before.st_size - 1) == 1 && last != '\n';
  if (torn) {
    line.insert(0, 1, '\n');
  }
  line += '\n';
  ssize_t written = 0;
  do {
    written = write(_file.get(), line.data(), line.size());
  } while (written < 0 && errno == EINTR);
  if (written == static_cast<ssize_t>(line.size())) {
    return true;
  }
  error = written < 0 ? systemError(_path) : _path + ": no room for a line";
  if (written > 0 && ftruncate(_file.get(), before.st_size) != 0) {
    error += ", and a part of it stays: ";
    error += std::strerror(errno);
  }
  return false;
}

std::optional<std::uint64_t> JsonLines::removeLocked(
    const std::function<bool(std::string_view line)>& goes, std::string& error) {
  const std::filesystem::path path(_path);
  std::optional<AtomicFile> kept = AtomicFile::create(path.parent_path(), error);
  if (!kept) {
    return std::nullopt;
  }
  std::ifstream stream(path);
  std::uint64_t removed = 0;
  for (std::string line; std::getline(stream, line);) {
    if (goes(line)) {
      ++removed;
    } else {
      kept->append(stream.eof() ? line : line + '\n');
    }
  }
  if (!stream.is_open() || stream.bad()) {
    error = systemError(_path);
    return std::nullopt;
  }
  return removed == 0 || kept->replace(path.filename(), error) ? std::optional(removed)
                                                               : std::nullopt;
}

}  // namespace vesprun
