#pragma once

namespace vesprun {

/// The daily record of the device's storage and hardware, in this order: disk usage and NAND info
/// as scalars of today, the structured storage log, the kernel's ECC events, data usage, reporting
/// channels. What fails is told in the system log, and the step goes on with what comes next.
///
/// Disk usage is "com.quill.homeshell.DiskUsageUserTotalBlocks" and
/// "com.quill.homeshell.DiskUsageUserBlocksFree" in units of 1,048,576 bytes, -1 when not known.
void LogDailyStorageAndDeviceStats();

}  // namespace vesprun
