#pragma once

#include <cstdint>
#include <string_view>

#include "NANDInfo/tables/FieldTable.h"
#include "vesprun/PropertyDict.h"

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

/// In this order: the purgeable space, the VM freezer figure and the disk figures;
/// "HLT_storeDemoMode", a 32-bit number; and, each if its source is there, unsigned 64-bit numbers
/// made of FTL fields: partition size in bands, format time in weeks, copies, the most boot-block
/// refreshes (always) and six sums of boot-block failures. Differences and sums wrap when negative.
///
/// Without FTL fields (null) an error is recorded, and only the device's fields are there.
PropertyDict gatherORUFTLOtherData(const PropertyDict* ftl);

/// The FTL fields that these fields come from.
extern const FieldTable kSourcesOfOtherData;

/// The derived fields that go into other sets than the FTL's: those of `FTLStats4MSPStats` that are
/// there, in its order, from the current FTL fields. Empty, with the error recorded, without these.
PropertyDict gatherORUOtherData();

}  // namespace vesprun
