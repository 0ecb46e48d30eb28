#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

// The storage-health fields, whose names begin with "HLT_". They go with the controller's own
// fields in the sets that leave the device.

/// The fields derived from the device and, when there is one, from a dictionary of FTL fields.
/// Never empty. In this order:
/// - the purgeable space (`getReclaimerInfo`), the VM freezer figure (`CopyVMFreezerNANDInfo`) and
///   the disk figures (`GetDiskInfo`), as these give them;
/// - "HLT_storeDemoMode": the 32-bit number 1 on a device in a shop's demo mode, else 0;
/// - from the FTL fields, each when what it is made from is there, as unsigned 64-bit numbers:
///   "HLT_intermediatePartitionSize" in bands (a negative size wraps), "HLT_formatWeeksSince2000",
///   copies of the average P/E cycles, host writes and hours and seconds of power,
///   "HLT_numBootBlockRefreshes_max" (always) and the six sums of boot-block failures, which are
///   formed in 64 bits and wrap when negative.
///
/// Without FTL fields (null) an error is recorded, and what the device tells is all.
PropertyDict gatherORUFTLOtherData(const PropertyDict* ftl);

/// The derived fields that go with other sets than that of the FTL: those of `FTLStats4MSPStats`
/// that are there, in the order of that list, made from the FTL fields of now. Empty, with the
/// error recorded, when these cannot be had.
PropertyDict gatherORUOtherData();

}  // namespace vesprun
