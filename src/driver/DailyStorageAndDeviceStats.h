#pragma once

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// Records the device's storage and hardware: disk usage in MiB (-1 when unknown), the structured
/// storage log, NAND info, the kernel's ECC events, data usage, reporting channels. A failure goes
/// to the system log, and the next part runs.
void LogDailyStorageAndDeviceStats();

/// Sets each number of the NAND info, as a signed 64-bit integer, and each boolean, as 1 or 0, as a
/// scalar of today under its key. Info with "com.quill.NANDInfo.Error" is only logged, at default
/// level.
void SetNANDInfoScalars(const PropertyDict& info);

}  // namespace vesprun
