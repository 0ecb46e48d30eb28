#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>

#include "platform/host/files/FileDescriptor.h"
#include "platform/host/files/FileLock.h"

namespace vesprun {

/// Appends lines to a file that several processes and threads may append to at once. Each line is
/// one write, so that lines never mix. The file is made with its first line and stays open. It is
/// for its owner alone, also when it was not before, and nothing but a regular file.
class JsonLines {
 public:
  /// What another process has locked is waited for, `longestWait` at most; after one wait in vain,
  /// not until a line could be appended again.
  explicit JsonLines(std::string path, std::chrono::milliseconds longestWait = kLongestLockWait)
      : _path(std::move(path)), _longestWait(longestWait), _wait(longestWait) {}

  /// Appends `line`, which holds no line feed, and ends it. A line of which only a part could be
  /// written is taken back; a part that was left by someone else is ended first, so that it spoils
  /// no other line. False, with a text in `error` that names the file, when the line is not there.
  bool append(std::string_view line, std::string& error);

  /// Makes what was appended durable.
  bool flush(std::string& error);

  /// Removes the lines that `goes` picks, all or none; those of other writers wait meanwhile. The
  /// number of lines that are gone; nothing, with a text in `error`, when that failed.
  std::optional<std::uint64_t> remove(const std::function<bool(std::string_view line)>& goes,
                                      std::string& error);

 private:
  bool open(std::string& error, int creating);
  bool lock(std::string& error, int creating);
  bool isNamed() const;
  std::optional<std::uint64_t> removeLocked(const std::function<bool(std::string_view line)>& goes,
                                            std::string& error);
  bool appendLocked(std::string_view line, std::string& error);

  std::string _path;
  std::chrono::milliseconds _longestWait;
  std::chrono::milliseconds _wait;
  std::mutex _mutex;  ///< the file's lock does not hold back the threads that share it
  FileDescriptor _file;
};

}  // namespace vesprun
