#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/Files.h"
#include "vesprun/Date.h"

namespace vesprun {

/// Removes logs from the outbox of a device, each with its header, and lines. Before a log is
/// removed, what is to be remembered of it is durable: its number, and for a daily log a note in
/// `kPrunedFile`. When a command was killed in between, the noted log is still there; it keeps its
/// revision and is not noted again. Its other notes go after it.
class LogPruning {
 public:
  /// `now` is the time of the notes. The directory must outlive the object; when it is read-only,
  /// everything is as if it had been removed. Calls `step` for each log that it reads or removes.
  LogPruning(
      const DeviceDirectory& directory, const Date& now, std::function<void()> step = [] {})
      : _directory(directory), _now(now), _step(std::move(step)) {}

  /// Removes the logs and the lines that were written before `time`.
  void removeBefore(const Date& time);

  /// Removes the logs with the lowest numbers until all files in the outbox together have fewer
  /// bytes, or no log is left. Where the lines alone are too many, no file of them keeps more than
  /// an eighth of `bytes`, the newest: a system log that grows must not drive out the logs.
  void removeUntilBelow(std::uint64_t bytes);

  /// Removes the notes of removed logs. At the end.
  void tidy();

  /// The files that were removed, without headers that went with their log.
  const std::vector<std::string>& removed() const { return _removed; }

  /// How many lines of which file, by its name.
  const std::map<std::string, std::uint64_t>& removedLines() const { return _removedLines; }

  /// The failures.
  const std::vector<std::string>& problems() const { return _problems; }

 private:
  struct Log;

  std::vector<Log> readFolder();
  std::uint64_t bytesLeft() const;
  template <typename IsOld>
  void removeLines(std::string_view file, const IsOld& isOld, std::uint64_t maxBytes);
  void remove(const std::vector<Log>& logs);
  std::optional<std::vector<const Log*>> noteDailyLogs(const std::vector<Log>& logs);
  void removeFiles(const Log& log);

  const DeviceDirectory& _directory;
  Date _now;
  std::function<void()> _step;
  /// Of the folder: else a header without a log may be that of a coming log.
  std::optional<FileDescriptor> _lock;
  std::vector<std::string> _removed;
  std::map<std::string, std::uint64_t> _removedLines;
  std::set<std::string> _gone;   ///< files, for a directory that is only looked at
  std::uint64_t _bytesGone = 0;  ///< likewise
  std::vector<std::string> _problems;
};

}  // namespace vesprun
