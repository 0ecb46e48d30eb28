#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

/// Records the device's storage and hardware, in this order: disk usage and NAND info as scalars of
/// today (the structured storage log between them), the kernel's ECC events, data usage, reporting
/// channels. Failures go to the system log, and the next part runs.
///
/// Disk usage is "com.quill.homeshell.DiskUsageUserTotalBlocks" and
/// "com.quill.homeshell.DiskUsageUserBlocksFree" in MiB, -1 when unknown.
void LogDailyStorageAndDeviceStats();

/// Sets each number of the NAND info, as a signed 64-bit integer, and each boolean, as 1 or 0, as a
/// scalar of today under its key. Info with "com.quill.NANDInfo.Error" is only logged, at default
/// level.
void SetNANDInfoScalars(const PropertyDict& info);

}  // namespace vesprun
