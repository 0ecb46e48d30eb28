#pragma once

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "platform/Clock.h"

namespace vesprun {

/// Owns a file descriptor.
class FileDescriptor {
 public:
  FileDescriptor() = default;
  explicit FileDescriptor(int descriptor) : _descriptor(descriptor) {}
  FileDescriptor(FileDescriptor&& other) noexcept
      : _descriptor(std::exchange(other._descriptor, -1)) {}
  FileDescriptor& operator=(FileDescriptor&& other) noexcept {
    std::swap(_descriptor, other._descriptor);
    return *this;
  }
  ~FileDescriptor() {
    if (_descriptor >= 0) {
      close(_descriptor);
    }
  }

  int get() const { return _descriptor; }
  bool isOpen() const { return _descriptor >= 0; }

 private:
  int _descriptor = -1;
};

inline FileDescriptor openFolder(const std::string& path) {
  return FileDescriptor(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
}

/// "PATH: REASON", the reason being that of `errno`.
inline std::string systemError(const std::string& path) {
  return path + ": " + std::strerror(errno);
}

/// How long to wait for another process's lock: longer than any of ours works, but not for one that
/// is stopped.
inline constexpr std::chrono::milliseconds kLongestLockWait(20'000);

/// Takes the lock (LOCK_SH or LOCK_EX) of the open file or folder at `path`, waiting `longestWait`
/// at most. On failure `error` names the path; `busy`, if given, becomes true when another holder
/// is the reason.
bool takeLock(int descriptor, int operation, std::chrono::milliseconds longestWait,
              const std::string& path, std::string& error, bool* busy = nullptr);

/// The folder, whose lock keeps other holders, in this process and others, from replacing files in
/// it until the descriptor is closed. Nothing on failure, as `takeLock` reports it.
std::optional<FileDescriptor> lockFolder(const std::string& folder, std::string& error,
                                         int operation = LOCK_EX,
                                         std::chrono::milliseconds longestWait = kLongestLockWait,
                                         bool* busy = nullptr);

/// The content of a regular file. Nothing, with the cause in `error`, when it cannot be read;
/// `missing`, if given, tells whether it does not exist.
std::optional<std::string> readWholeFile(const std::string& path, std::string& error,
                                         bool* missing = nullptr);

/// The names in a folder, sorted by bytes; none when it does not exist. Nothing, with the cause in
/// `error`, when it cannot be read to its end.
std::optional<std::vector<std::string>> namesInFolder(const std::string& folder,
                                                      std::string& error);

/// "PATH.WHY-20240305T091502Z": where a file that cannot be used is kept.
std::string nameAside(const std::string& path, std::string_view why, Clock& clock);

}  // namespace vesprun
