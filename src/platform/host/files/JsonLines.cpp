#include "platform/host/files/JsonLines.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <utility>
#include <vector>

#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/LineReader.h"

namespace vesprun {

bool forEachLineOf(const HostPath& path, const std::function<void(std::string_view line)>& take,
                   std::string& error, std::uint64_t begin) {
  bool missing = false;
  FileDescriptor file = openToRead(path, error, &missing);
  if (!file.isOpen()) {
    return missing;
  }
  const off_t size = lseek(file.get(), 0, SEEK_END);
  constexpr auto kMax = static_cast<off_t>(kMaxLinesFile);
  if (size < 0 ||
      lseek(file.get(), std::max(static_cast<off_t>(begin), size - kMax), SEEK_SET) < 0) {
    error = systemError(path);
    return false;
  }
  LineReader lines(std::move(file), kMaxLine);
  std::string_view line;
  auto result = lines.next(line);
  for (; result != LineReader::Result::End && result != LineReader::Result::Failed;
       result = lines.next(line)) {
    take(result == LineReader::Result::Line ? line : std::string_view());
  }
  if (result == LineReader::Result::Failed) {
    error = systemError(path);
  }
  return result == LineReader::Result::End;
}

bool JsonLines::open(std::string& error, int creating) {
  // Opened for reading as well, to see how the last line ends.
  FileDescriptor file = openToChange(_path, O_RDWR | O_APPEND | creating, error);
  if (!file.isOpen()) {
    return false;
  }
  _file = std::move(file);
  return true;
}

bool JsonLines::append(std::string line, std::string& error) {
  if (line.find('\n') != std::string::npos) {
    error = _path.string() + ": a line cannot hold a line feed";
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
    const std::function<bool(std::string_view line)>& goes, std::string& error,
    std::uint64_t maxBytes) {
  const std::scoped_lock guard(_mutex);
  errno = 0;
  if (!lock(error, 0)) {
    return errno == ENOENT ? std::optional<std::uint64_t>(0) : std::nullopt;
  }
  const std::optional<std::uint64_t> removed = removeLocked(goes, maxBytes, error);
  flock(_file.get(), LOCK_UN);
  return removed;
}

bool JsonLines::lock(std::string& error, int creating) {
  // A file that was deleted or replaced meanwhile would take the line with it. While it is locked,
  // nobody replaces it.
  do {
    if (!isNamed() && !open(error, creating)) {
      return false;
    }
    const bool locked = takeLock(_file.get(), LOCK_EX, _wait, _path, error);
    // Only one line waits for whoever keeps the file; the rest would add up to an endless wait.
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
  std::string_view rest = line;
  while (!rest.empty()) {
    const ssize_t written = write(_file.get(), rest.data(), rest.size());
    if (written > 0) {
      rest.remove_prefix(static_cast<std::size_t>(written));
    } else if (written == 0 || errno != EINTR) {
      break;
    }
  }
  if (rest.empty()) {
    return true;
  }
  const bool isPart = rest.size() < line.size();
  error = isPart ? _path.string() + ": no room for a line" : systemError(_path);
  if (isPart && ftruncate(_file.get(), before.st_size) != 0) {
    error += ", and a part of it stays: ";
    error += std::strerror(errno);
  }
  return false;
}

std::optional<std::uint64_t> JsonLines::removeLocked(
    const std::function<bool(std::string_view line)>& goes, std::uint64_t maxBytes,
    std::string& error) {
  std::optional<AtomicFile> kept = AtomicFile::create(_path.folder(), error);
  const auto keep = [&kept](std::string_view line) { kept->append(line); };
  const std::optional<std::uint64_t> removed =
      kept ? sort(_file.get(), goes, maxBytes, keep, error) : std::nullopt;
  return removed.value_or(0) == 0 || kept->replace(_path.name(), error) ? removed : std::nullopt;
}

std::optional<std::uint64_t> JsonLines::countRemoved(
    const std::function<bool(std::string_view line)>& goes, std::uint64_t& bytes,
    std::string& error, std::uint64_t maxBytes) const {
  bool missing = false;
  const FileDescriptor file = openToRead(_path, error, &missing);
  struct stat status {};
  if (!file.isOpen()) {
    return missing ? std::optional<std::uint64_t>(0) : std::nullopt;
  }
  if (fstat(file.get(), &status) != 0) {
    error = systemError(_path);
    return std::nullopt;
  }
  bytes = static_cast<std::uint64_t>(status.st_size);
  const auto keep = [&bytes](std::string_view line) { bytes -= std::min(bytes, line.size()); };
  return sort(file.get(), goes, maxBytes, keep, error);
}

std::optional<std::uint64_t> JsonLines::sort(int file,
                                             const std::function<bool(std::string_view line)>& goes,
                                             std::uint64_t maxBytes,
                                             const std::function<void(std::string_view line)>& keep,
                                             std::string& error) const {
  struct stat status {};
  if (fstat(file, &status) != 0) {
    error = systemError(_path);
    return std::nullopt;
  }
  const auto size = static_cast<std::uint64_t>(status.st_size);
  maxBytes = std::min(maxBytes, kMaxLinesFile);
  std::uint64_t place = size > kMaxLinesFile ? size - kMaxLinesFile - 1 : 0;
  std::uint64_t removed = 0;
  std::string line;
  bool isTooLong = false;
  const auto take = [&](std::string_view end, std::uint64_t next) {
    const bool isBefore = next - line.size() - end.size() + maxBytes < size;
    if (isTooLong || isBefore || goes(line)) {
      ++removed;
    } else {
      keep(line.append(end));
    }
    line.clear();
    isTooLong = false;
  };
  std::vector<char> piece(256 * 1024);
  while (true) {
    const ssize_t count = pread(file, piece.data(), piece.size(), static_cast<off_t>(place));
    if (count < 0 && errno == EINTR) {
      continue;
    }
    if (count < 0) {
      error = systemError(_path);
      return std::nullopt;
    }
    if (count == 0) {
      break;
    }
    std::string_view text(piece.data(), static_cast<std::size_t>(count));
    for (std::size_t feed = 0; (feed = text.find('\n')) != std::string_view::npos;) {
      line.append(text.substr(0, feed));
      text.remove_prefix(feed + 1);
      place += feed + 1;
      take("\n", place);
    }
    place += text.size();
    line.append(text);
    if (line.size() > kMaxLine) {
      isTooLong = true;
      line.clear();
    }
  }
  if (!line.empty() || isTooLong) {
    take("", place);
  }
  return removed;
}

}  // namespace vesprun
