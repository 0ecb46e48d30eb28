#pragma once

#include <cstdint>
#include <string_view>

#include "NANDInfo/tables/FieldTable.h"
#include "common/PropertyDict.h"

namespace vesprun {

// The storage-health fields, "HLT_...", which accompany the controller's own fields in the sets
// that leave the device.

/// Copies a field, if present, under another name.
void copyField(const PropertyDict& from, std::string_view name, PropertyDict& to,
               std::string_view newName);

/// Is the device on display in a shop?
bool isInStoreDemoMode();

/// Whole weeks since 2000-01-01 00:00 UTC; 0 before.
std::uint64_t weeksSince2000(std::uint64_t secondsSince1970);

/// "HLT_Reclaimer_totalPurgeable" and "HLT_Reclaimer_totalNonPurgeable" as far as the service for
/// purgeable space gives them.
PropertyDict getReclaimerInfo();

/// The fields derived from the device and, if there are any, from FTL fields, in this order:
///
/// - the purgeable space (`getReclaimerInfo`), the VM freezer figure (`CopyVMFreezerNANDInfo`) and
///   the disk figures (`GetDiskInfo`);
/// - "HLT_storeDemoMode", a 32-bit number, 1 or 0;
/// - unsigned 64-bit numbers, each if its source is there: "HLT_intermediatePartitionSize" in bands
///   (wraps when negative), "HLT_formatWeeksSince2000", copies of the average P/E cycles, host
///   writes and power-on hours and seconds, "HLT_numBootBlockRefreshes_max" (always), and six sums
///   of boot-block failures, formed in 64 bits and wrapped when negative.
///
/// Without FTL fields (null) an error is recorded, and only the device's fields are there.
PropertyDict gatherORUFTLOtherData(const PropertyDict* ftl);

/// The FTL fields that these fields come from.
extern const FieldTable kSourcesOfOtherData;

/// The derived fields of other sets than the FTL's: those of `FTLStats4MSPStats` that are there, in
/// its order, from the FTL fields of now. Empty, with the error recorded, without these.
PropertyDict gatherORUOtherData();

}  // namespace vesprun
