#include "platform/host/files/Files.h"

#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <memory>
#include <thread>

#include "common/Calendar.h"

namespace vesprun {
bool takeLock(int descriptor, int operation, std::chrono::milliseconds longestWait,
              const std::string& path, std::string& error, bool* busy) {
  constexpr std::chrono::milliseconds kPause(1);
  const auto end = std::chrono::steady_clock::now() + longestWait;
  while (flock(descriptor, operation | LOCK_NB) != 0) {
    if (errno != EWOULDBLOCK && errno != EINTR) {
      error = systemError(path);
      return false;
    }
    if (std::chrono::steady_clock::now() >= end) {
      error = path + ": another process keeps it locked";
      if (busy != nullptr) {
        *busy = true;
      }
      return false;
    }
    std::this_thread::sleep_for(kPause);
  }
  return true;
}

std::optional<FileDescriptor> lockFolder(const HostPath& folder, std::string& error, int operation,
                                         std::chrono::milliseconds longestWait, bool* busy) {
  FileDescriptor descriptor = openFolder(folder);
  if (!descriptor.isOpen()) {
    error = systemError(folder);
  } else if (takeLock(descriptor.get(), operation, longestWait, folder, error, busy)) {
    return descriptor;
  }
  return std::nullopt;
}

FileDescriptor openToRead(const HostPath& path, std::string& error, bool* missing) {
  // A pipe or device must not block the reader.
  FileDescriptor file = path.open(O_RDONLY | O_NONBLOCK);
  struct stat status {};
  if (missing != nullptr) {
    *missing = !file.isOpen() && errno == ENOENT;
  }
  if (!file.isOpen() || fstat(file.get(), &status) != 0) {
    error = systemError(path);
    return {};
  }
  if (!S_ISREG(status.st_mode)) {
    error = path.string() + (S_ISDIR(status.st_mode) ? ": Is a directory" : ": not a regular file");
    return {};
  }
  return file;
}

std::optional<std::string> readWholeFile(const HostPath& path, std::string& error, bool* missing,
                                         std::uint64_t maxSize) {
  const FileDescriptor file = openToRead(path, error, missing);
  struct stat status {};
  if (!file.isOpen()) {
    return std::nullopt;
  }
  if (fstat(file.get(), &status) != 0) {
    error = systemError(path);
    return std::nullopt;
  }
  const auto isTooLarge = [&](std::uint64_t size) {
    if (size > maxSize) {
      error = path.string() + ": larger than " + std::to_string(maxSize) + " bytes";
    }
    return size > maxSize;
  };
  if (isTooLarge(static_cast<std::uint64_t>(status.st_size))) {
    return std::nullopt;
  }
  // A file that shrinks or grows meanwhile gives what was there.
  std::string content(static_cast<std::size_t>(status.st_size) + 1, '\0');
  std::size_t length = 0;
  for (ssize_t count = 1; count != 0;) {
    if (length > maxSize) {
      break;
    }
    if (length == content.size()) {
      content.resize(content.size() + (content.size() / 2) + 4096);
    }
    count = read(file.get(), content.data() + length, content.size() - length);
    if (count < 0 && errno != EINTR) {
      error = systemError(path);
      return std::nullopt;
    }
    length += count > 0 ? static_cast<std::size_t>(count) : 0;
  }
  content.resize(length);
  return isTooLarge(length) ? std::nullopt : std::optional(std::move(content));
}

// The standard library's iterator ends the process when memory runs out.
std::optional<std::vector<std::string>> namesInFolder(const HostPath& folder, std::string& error) {
  struct Close {
    void operator()(DIR* stream) const { closedir(stream); }
  };
  std::vector<std::string> names;
  FileDescriptor opened = openFolder(folder);
  if (!opened.isOpen() && errno == ENOENT) {
    return names;
  }
  const std::unique_ptr<DIR, Close> stream(opened.isOpen() ? fdopendir(opened.get()) : nullptr);
  if (stream) {
    opened.release();
  }
  while (stream) {
    errno = 0;
    const dirent* const entry = readdir(stream.get());
    if (entry == nullptr) {
      break;
    }
    const std::string_view name = entry->d_name;
    if (name != "." && name != "..") {
      names.emplace_back(name);
    }
  }
  if (errno != 0) {
    error = systemError(folder);
    return std::nullopt;
  }
  std::sort(names.begin(), names.end());
  return names;
}

FileDescriptor openToChange(const HostPath& path, int flags, std::string& error) {
  // Without blocking, in case of a pipe.
  FileDescriptor file = path.open(flags | O_NONBLOCK | O_NOFOLLOW, 0600);
  struct stat status {};
  if (!file.isOpen() || fstat(file.get(), &status) != 0) {
    error = systemError(path);
    return {};
  }
  const std::optional<struct stat> folder = path.folder().status();
  const char* fault = nullptr;
  if (!S_ISREG(status.st_mode)) {
    fault = ": not a regular file";
  } else if (status.st_nlink > 1) {
    fault = ": has a second name";
  } else if (status.st_uid != geteuid() && (!folder || status.st_uid != folder->st_uid)) {
    fault = ": belongs to another user";
  } else if ((status.st_mode & 0777) != 0600 && fchmod(file.get(), 0600) != 0) {
    error = systemError(path);
    return {};
  }
  if (fault != nullptr) {
    error = path.string() + fault;
    return {};
  }
  return file;
}

bool removeFile(const HostPath& path) {
  const FileDescriptor folder = openFolder(path.folder());
  return folder.isOpen() && unlinkat(folder.get(), path.name().c_str(), 0) == 0;
}

bool renameFile(const HostPath& path, const std::string& newName) {
  const FileDescriptor folder = openFolder(path.folder());
  return folder.isOpen() &&
         renameat(folder.get(), path.name().c_str(), folder.get(), newName.c_str()) == 0;
}

std::string timeInName(const Date& time) {
  std::string text = dateText({time.seconds, 0});
  std::erase_if(text, [](char c) { return c == '-' || c == ':'; });
  return text;
}

std::string nameAside(const std::string& path, std::string_view why, Clock& clock) {
  return path + '.' + std::string(why) + '-' + timeInName(clock.now());
}

}  // namespace vesprun
