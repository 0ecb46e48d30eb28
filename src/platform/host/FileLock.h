#pragma once

#include <chrono>
#include <optional>
#include <string>

#include "platform/host/FileDescriptor.h"

namespace vesprun {

/// How long a lock is waited for that others hold for a moment only: a process that was stopped
/// while it held one must not stop every later run.
inline constexpr std::chrono::milliseconds kLongestLockWait{5000};

/// Locks an open file or folder, `operation` being LOCK_SH or LOCK_EX, until it is closed or
/// unlocked. False, with a text in `error` that names `path`, when it cannot be had within
/// `longestWait`.
bool lockFile(const FileDescriptor& file, int operation, std::chrono::milliseconds longestWait,
              const std::string& path, std::string& error);

/// A lock on a folder that is held as long as the object lives.
class FolderLock {
 public:
  /// Keeps other processes, and other holders in this one, from replacing files in the folder.
  static std::optional<FolderLock> take(const std::string& folder, std::string& error);
  /// The same as `lockFile`.
  static std::optional<FolderLock> take(const std::string& folder, int operation,
                                        std::chrono::milliseconds longestWait, std::string& error);

 private:
  explicit FolderLock(FileDescriptor folder) : _folder(std::move(folder)) {}

  FileDescriptor _folder;  ///< closing it releases the lock
};

}  // namespace vesprun
