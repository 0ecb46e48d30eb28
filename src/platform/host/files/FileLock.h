#pragma once

#include <chrono>
#include <optional>
#include <string>
#include <utility>

#include "platform/host/files/FileDescriptor.h"

namespace vesprun {

/// How long a lock of another process is waited for: long enough for any of ours that is running,
/// not for one that is stopped.
inline constexpr std::chrono::milliseconds kLongestLockWait(20'000);

/// Takes the lock (LOCK_SH or LOCK_EX) of the open file or folder at `path`, waiting `longestWait`
/// at most. False, with a text in `error` that names the path, when it cannot be had. `busy`, when
/// given, becomes true if that is because of another holder.
bool takeLock(int descriptor, int operation, std::chrono::milliseconds longestWait,
              const std::string& path, std::string& error, bool* busy = nullptr);

/// Keeps other processes, and other holders in this one, from replacing files in a folder.
class FolderLock {
 public:
  enum class Kind { Shared, Exclusive };

  /// Waits for the lock and holds it as long as the object lives. Nothing, with a text in `error`
  /// that names the folder, when it cannot be had. `busy`, when given, becomes true if that is
  /// because of another holder.
  static std::optional<FolderLock> take(const std::string& folder, std::string& error,
                                        Kind kind = Kind::Exclusive,
                                        std::chrono::milliseconds longestWait = kLongestLockWait,
                                        bool* busy = nullptr);

 private:
  explicit FolderLock(FileDescriptor folder) : _folder(std::move(folder)) {}

  FileDescriptor _folder;  ///< closing it releases the lock
};

}  // namespace vesprun
