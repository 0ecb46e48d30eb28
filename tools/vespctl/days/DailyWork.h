#pragma once

#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/FileLock.h"

namespace vesprun {

/// Waits until no run is at the daily work, and keeps others from it as long as the result lives.
/// Throws `CommandFailure` when one takes minutes.
FolderLock takeDailyWork(const DeviceDirectory& directory);

}  // namespace vesprun
