#pragma once

#include <chrono>
#include <optional>
#include <string>
#include <utility>

#include "platform/host/files/Files.h"

namespace vesprun {

/// How long to wait for another process's lock: longer than any of ours works, but not for one that
/// is stopped.
inline constexpr std::chrono::milliseconds kLongestLockWait(20'000);

/// Takes the lock (LOCK_SH or LOCK_EX) of the open file or folder at `path`, waiting `longestWait`
/// at most. On failure `error` names the path; `busy`, if given, becomes true when another holder
/// is the reason.
bool takeLock(int descriptor, int operation, std::chrono::milliseconds longestWait,
              const std::string& path, std::string& error, bool* busy = nullptr);

/// Keeps other holders, in this process and others, from replacing files in a folder.
class FolderLock {
 public:
  enum class Kind { Shared, Exclusive };

  /// Holds the lock as long as the object lives. Nothing on failure, as `takeLock` reports it.
  static std::optional<FolderLock> take(const std::string& folder, std::string& error,
                                        Kind kind = Kind::Exclusive,
                                        std::chrono::milliseconds longestWait = kLongestLockWait,
                                        bool* busy = nullptr);

 private:
  explicit FolderLock(FileDescriptor folder) : _folder(std::move(folder)) {}

  FileDescriptor _folder;  ///< closing it releases the lock
};

}  // namespace vesprun
