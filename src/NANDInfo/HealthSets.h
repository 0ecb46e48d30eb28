#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

// A few figures on the storage's health for other parts of the system. Every key begins with
// "com.quill.NANDInfo.Health.", every value is a signed number.

/// All of them, made from the FTL fields of now: "MaxPercentageNANDUsed", "MaxE2EErrors" and
/// "HostReadErrors", read as signed 32-bit numbers and at least 0; "NumGrownBadBlocks",
/// "SpareAvailablePercent" and "NumDieFailures", signed 64-bit, -1 when not known. Empty, with the
/// error recorded, when the fields cannot be had.
PropertyDict gatherNANDHealthInfo();

/// For service plans, with "HLT_APIErrorMessage": everything but the spare blocks.
PropertyDict CopyTendmarkNANDInfo();

/// For updates over the air: everything but the spare blocks and the die failures. Empty when
/// nothing could be had.
PropertyDict CopyOTANANDInfo();

/// For labs, with "HLT_APIErrorMessage": everything but the die failures, and "IsNANDRetirable", 1
/// when the spare blocks are being used up or the expected life is over, else 0.
PropertyDict CopyInternalLabNANDInfo();

}  // namespace vesprun
