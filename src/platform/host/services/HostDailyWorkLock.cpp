#include "platform/host/services/HostDailyWorkLock.h"

#include <chrono>
#include <string>

namespace vesprun {

bool HostDailyWorkLock::lock(double seconds) {
  if (_held) {
    return true;
  }
  const std::chrono::milliseconds longestWait(static_cast<std::int64_t>(seconds * 1000));
  std::string error;
  bool busy = false;
  _held =
      FolderLock::take(_directory.path(), error, FolderLock::Kind::Exclusive, longestWait, &busy);
  if (!_held) {
    _log.write(LogLevel::Error, error);
  }
  return !busy;
}

}  // namespace vesprun
