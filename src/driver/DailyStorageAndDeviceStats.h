#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

/// The daily record of the device's storage and hardware, in this order: disk usage and NAND info
/// as scalars of today, the structured storage log, the kernel's ECC events, data usage, reporting
/// channels. What fails is told in the system log, and the step goes on with what comes next.
///
/// Disk usage is "com.quill.homeshell.DiskUsageUserTotalBlocks" and
/// "com.quill.homeshell.DiskUsageUserBlocksFree" in units of 1,048,576 bytes, -1 when not known.
void LogDailyStorageAndDeviceStats();

/// Sets a scalar of today for every number of the NAND info, under its key: the number as a signed
/// 64-bit integer, a boolean as 1 or 0. Values of other types are passed over.
///
/// When the info tells of an error ("com.quill.NANDInfo.Error"), a message at the default level is
/// all that comes of it.
void SetNANDInfoScalars(const PropertyDict& info);

}  // namespace vesprun
