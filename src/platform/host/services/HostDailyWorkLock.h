#pragma once

#include <optional>

#include "platform/DailyWorkLock.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/FileLock.h"

namespace vesprun {

/// The lock of the device directory itself: no file is left behind, and the kernel frees it when
/// its process ends.
class HostDailyWorkLock final : public DailyWorkLock {
 public:
  HostDailyWorkLock(const DeviceDirectory& directory, SystemLog& log)
      : _directory(directory), _log(log) {}

  bool lock(double seconds) override;

 private:
  const DeviceDirectory& _directory;
  SystemLog& _log;
  std::optional<FolderLock> _held;
};

}  // namespace vesprun
