#pragma once

#include <mutex>
#include <string>
#include <string_view>

#include "platform/host/FileDescriptor.h"
#include "platform/host/FileLock.h"

namespace vesprun {

/// Appends lines to a file that several processes and threads may append to at once. Each line is
/// one write, so that lines never mix. The file is made with its first line, for its owner alone,
/// and stays open.
class JsonLines {
 public:
  explicit JsonLines(std::string path) : _path(std::move(path)) {}

  /// Appends `line`, which holds no line feed, and ends it. A line of which only a part could be
  /// written is taken back; a part that was left by someone else is ended first, so that it spoils
  /// no other line. False, with a text in `error` that names the file, when the line is not there;
  /// also when another process keeps the file locked for long, which is waited for once.
  bool append(std::string_view line, std::string& error);

 private:
  bool open();
  bool appendLocked(std::string_view line, std::string& error);

  std::string _path;
  std::mutex _mutex;  ///< the file's lock does not hold back the threads that share it
  FileDescriptor _file;
  std::chrono::milliseconds _longestWait = kLongestLockWait;
};

}  // namespace vesprun
