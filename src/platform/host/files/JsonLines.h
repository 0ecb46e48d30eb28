#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>

#include "platform/host/files/Files.h"

namespace vesprun {

/// A line of ours is shorter, and whoever prunes keeps the file smaller: more may be all hole.
inline constexpr std::uint64_t kMaxLine = 16 * 1024 * 1024;
inline constexpr std::uint64_t kMaxLinesFile = 1024 * 1024 * 1024;

/// Calls `take` with each line of the file, from the byte `begin` on and of the last
/// `kMaxLinesFile` bytes; with an empty one for what is longer than `kMaxLine`. A missing file has
/// no lines. False, with the cause in `error`, when it cannot be read to its end.
bool forEachLineOf(const HostPath& path, const std::function<void(std::string_view line)>& take,
                   std::string& error, std::uint64_t begin = 0);

/// Appends lines to a file that several processes and threads share. Each line is one write, so
/// lines never mix. The file is created with its first line, stays open, must be a regular file,
/// and becomes its owner's alone.
class JsonLines {
 public:
  /// Waits `longestWait` at most for another process's lock; after one wait in vain, no longer at
  /// all until a line could be appended.
  explicit JsonLines(HostPath path, std::chrono::milliseconds longestWait = kMaxLockWait)
      : _path(std::move(path)), _longestWait(longestWait), _wait(longestWait) {}

  /// Appends `line`, which holds no line feed. A partly written line is removed again; a torn line
  /// of someone else is ended first. False, with the file in `error`, when the line is not there.
  bool append(std::string line, std::string& error);

  /// Removes the lines that `goes` picks, and the first ones of a file that has more than
  /// `maxBytes`, all or none; those of other writers wait meanwhile. What is longer than `kMaxLine`
  /// is not a line and goes too. The number of lines that are gone, without those before the last
  /// `kMaxLinesFile` bytes; nothing, with a text in `error`, when that failed.
  std::optional<std::uint64_t> remove(const std::function<bool(std::string_view line)>& goes,
                                      std::string& error, std::uint64_t maxBytes = kMaxLinesFile);

  /// What `remove` would remove, and how many bytes. Changes nothing.
  std::optional<std::uint64_t> countRemoved(const std::function<bool(std::string_view line)>& goes,
                                            std::uint64_t& bytes, std::string& error,
                                            std::uint64_t maxBytes) const;

 private:
  bool open(std::string& error, int creating);
  bool lock(std::string& error, int creating);
  bool isNamed() const;
  std::optional<std::uint64_t> removeLocked(const std::function<bool(std::string_view line)>& goes,
                                            std::uint64_t maxBytes, std::string& error);
  /// Passes each line that stays to `keep`, with its end.
  std::optional<std::uint64_t> sort(int file,
                                    const std::function<bool(std::string_view line)>& goes,
                                    std::uint64_t maxBytes,
                                    const std::function<void(std::string_view line)>& keep,
                                    std::string& error) const;
  bool appendLocked(std::string line, std::string& error);

  HostPath _path;
  std::chrono::milliseconds _longestWait;
  std::chrono::milliseconds _wait;
  std::mutex _mutex;  ///< threads share the file's lock
  FileDescriptor _file;
};

}  // namespace vesprun
