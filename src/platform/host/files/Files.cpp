#include "platform/host/files/Files.h"

#include <dirent.h>
#include <sys/stat.h>

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

std::optional<FileDescriptor> lockFolder(const std::string& folder, std::string& error,
                                         int operation, std::chrono::milliseconds longestWait,
                                         bool* busy) {
  FileDescriptor descriptor = openFolder(folder);
  if (!descriptor.isOpen()) {
    error = systemError(folder);
  } else if (takeLock(descriptor.get(), operation, longestWait, folder, error, busy)) {
    return descriptor;
  }
  return std::nullopt;
}

std::optional<std::string> readWholeFile(const std::string& path, std::string& error,
                                         bool* missing) {
  // A pipe or device must not block the reader.
  const FileDescriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  struct stat status {};
  if (missing != nullptr) {
    *missing = !file.isOpen() && errno == ENOENT;
  }
  if (!file.isOpen() || fstat(file.get(), &status) != 0) {
    error = systemError(path);
    return std::nullopt;
  }
  if (!S_ISREG(status.st_mode)) {
    error = path + (S_ISDIR(status.st_mode) ? ": Is a directory" : ": not a regular file");
    return std::nullopt;
  }
  // A file that shrinks or grows meanwhile gives what was there.
  std::string content(static_cast<std::size_t>(status.st_size) + 1, '\0');
  std::size_t length = 0;
  for (ssize_t count = 1; count != 0;) {
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
  return content;
}

// The standard library's iterator ends the process when memory runs out.
std::optional<std::vector<std::string>> namesInFolder(const std::string& folder,
                                                      std::string& error) {
  struct Close {
    void operator()(DIR* stream) const { closedir(stream); }
  };
  std::vector<std::string> names;
  const std::unique_ptr<DIR, Close> stream(opendir(folder.c_str()));
  if (!stream && errno == ENOENT) {
    return names;
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

std::string nameAside(const std::string& path, std::string_view why, Clock& clock) {
  std::string time = dateText({clock.now().seconds, 0});
  std::erase_if(time, [](char c) { return c == '-' || c == ':'; });
  return path + '.' + std::string(why) + '-' + time;
}

}  // namespace vesprun
