#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "common/Date.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/Files.h"

namespace vesprun {

/// Removes logs from the outbox of a device, each with its header. Before a log is removed, what is
/// to be remembered of it is durable: its number, and for a daily log a note in `pruned.jsonl`.
/// When a command was killed in between, the noted log is still there; it keeps its revision and is
/// not noted again.
class LogPruning {
 public:
  /// `now` is the time of the notes. The directory must outlive the object.
  LogPruning(const DeviceDirectory& directory, const Date& now)
      : _directory(directory), _now(now) {}

  /// Removes the logs that were written before `time`.
  void removeBefore(const Date& time);

  /// Removes the logs with the lowest numbers until all files in the outbox together have fewer
  /// bytes, or no log is left.
  void removeUntilBelow(std::uint64_t bytes);

  /// The files that were removed, without headers that went with their log.
  const std::vector<std::string>& removed() const { return _removed; }

  /// What could not be done.
  const std::vector<std::string>& problems() const { return _problems; }

 private:
  struct Log;

  std::vector<Log> readFolder();
  void remove(const std::vector<Log>& logs);
  std::vector<const Log*> noteDailyLogs(const std::vector<Log>& logs);
  void unlinkFiles(const Log& log);

  const DeviceDirectory& _directory;
  Date _now;
  /// Of the folder: else a header without a log may be that of a coming log.
  std::optional<FileDescriptor> _lock;
  std::vector<std::string> _removed;
  std::vector<std::string> _problems;
};

}  // namespace vesprun
