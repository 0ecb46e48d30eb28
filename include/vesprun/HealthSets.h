#pragma once

#include "Export.h"
#include "PropertyDict.h"

namespace vesprun {

// Figures on the storage's health, from the current FTL fields. Keys begin with
// "com.quill.NANDInfo.Health."; values are signed. "MaxPercentageNANDUsed", "MaxE2EErrors" (32
// bits) and "HostReadErrors" (64) are never negative; "NumGrownBadBlocks", "SpareAvailablePercent"
// and "NumDieFailures" (64) are -1 when unknown. If the FTL fields cannot be read, the sets have no
// figures and the error is recorded.

/// For service plans: all but the spare blocks, with "HLT_APIErrorMessage".
VESPRUN_EXPORT PropertyDict CopyTendmarkNANDInfo() noexcept;

/// For updates over the air: all but the spare blocks and the die failures.
VESPRUN_EXPORT PropertyDict CopyOTANANDInfo() noexcept;

/// For labs: all but the die failures, with "HLT_APIErrorMessage" and "IsNANDRetirable", 1 when
/// spare blocks are being used up or the expected life is over, else 0.
VESPRUN_EXPORT PropertyDict CopyInternalLabNANDInfo() noexcept;

}  // namespace vesprun
