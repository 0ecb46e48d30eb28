#include "platform/host/files/FileLock.h"

#include <sys/file.h>

#include <cerrno>
#include <thread>

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

std::optional<FolderLock> FolderLock::take(const std::string& folder, std::string& error, Kind kind,
                                           std::chrono::milliseconds longestWait, bool* busy) {
  FileDescriptor descriptor = openFolder(folder);
  if (!descriptor.isOpen()) {
    error = systemError(folder);
    return std::nullopt;
  }
  if (!takeLock(descriptor.get(), kind == Kind::Shared ? LOCK_SH : LOCK_EX, longestWait, folder,
                error, busy)) {
    return std::nullopt;
  }
  return FolderLock(std::move(descriptor));
}

}  // namespace vesprun
