#pragma once

#include "../Export.h"
#include "../common/PropertyDict.h"

namespace vesprun {

// A few figures on the storage's health, made from the FTL fields of now. Every key begins with
// "com.quill.NANDInfo.Health.", every value is a signed number: "MaxPercentageNANDUsed" and
// "MaxE2EErrors" of 32 bits and "HostReadErrors" of 64, at least 0; "NumGrownBadBlocks",
// "SpareAvailablePercent" and "NumDieFailures" of 64 bits, -1 when not known. None of them, with
// the error recorded, when the fields cannot be had.

/// For service plans, with "HLT_APIErrorMessage": everything but the spare blocks.
VESPRUN_EXPORT PropertyDict CopyTendmarkNANDInfo() noexcept;

/// For updates over the air: everything but the spare blocks and the die failures.
VESPRUN_EXPORT PropertyDict CopyOTANANDInfo() noexcept;

/// For labs, with "HLT_APIErrorMessage": everything but the die failures, and "IsNANDRetirable", 1
/// when the spare blocks are being used up or the expected life is over, else 0.
VESPRUN_EXPORT PropertyDict CopyInternalLabNANDInfo() noexcept;

}  // namespace vesprun
