#pragma once

#include <cstdint>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

// The storage-health fields, whose names begin with "HLT_". They go with the controller's own
// fields in the sets that leave the device.

/// Copies a field, if it is there, under another name.
void copyField(const PropertyDict& from, std::string_view name, PropertyDict& to,
               std::string_view newName);

/// Is the device set up for a shop's customers to try?
bool isInStoreDemoMode();

/// Whole weeks since 2000-01-01 00:00 UTC; 0 before.
std::uint64_t weeksSince2000(std::uint64_t secondsSince1970);

/// "HLT_Reclaimer_totalPurgeable" and "HLT_Reclaimer_totalNonPurgeable", each only when the
/// purgeable-space service gives it, as it gives it.
PropertyDict getReclaimerInfo();

/// The fields derived from the device and, when there is one, from a dictionary of FTL fields, in
/// this order:
/// - the purgeable space (`getReclaimerInfo`), the VM freezer figure (`CopyVMFreezerNANDInfo`) and
///   the disk figures (`GetDiskInfo`);
/// - "HLT_storeDemoMode", a 32-bit number, 1 or 0;
/// - from the FTL fields, each when what it is made from is there, as unsigned 64-bit numbers:
///   "HLT_intermediatePartitionSize" in bands (a negative size wraps), "HLT_formatWeeksSince2000",
///   copies of the average P/E cycles, host writes and hours and seconds of power,
///   "HLT_numBootBlockRefreshes_max" (always) and the six sums of boot-block failures, which are
///   formed in 64 bits and wrap when negative.
///
/// Without FTL fields (null) an error is recorded, and only the device's own fields are there.
PropertyDict gatherORUFTLOtherData(const PropertyDict* ftl);

/// The derived fields that go with other sets than that of the FTL: those of `FTLStats4MSPStats`
/// that are there, in the order of that list, made from the FTL fields of now. Empty, with the
/// error recorded, when these cannot be had.
PropertyDict gatherORUOtherData();

}  // namespace vesprun
