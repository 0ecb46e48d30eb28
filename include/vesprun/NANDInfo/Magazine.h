#pragma once

#include <cstdint>

#include "../Export.h"
#include "../common/PropertyDict.h"

namespace vesprun {

// The stats magazine: snapshots of the FTL fields, one every four hours.

/// What happened between the stats-magazine snapshot of `hours` hours ago and the newest one. Of
/// `hours` the low 32 bits count.
///
/// Counters that accumulate are doubles, reported when `mode` is 0 or 2: with `deltaWanted` (not 0)
/// what they grew by, but as the old snapshot has them when no time lies between the two; without
/// it always as the old one has them. Instantaneous values are the old snapshot's, unchanged,
/// reported when `mode` is 1 or 2.
///
/// In this order: "com.quill.NANDInfo.IsStatMagSupported"; when both snapshots have a time stamp
/// "HLT_SM_deltaDays", a double, and the fields that both have, in the old one's order; the fields
/// derived from those of the newest snapshot; the average P/E cycles "of the period", doubles made
/// from the erase counters above and the partitions of now; "HLT_APIErrorMessage". When the newest
/// snapshot is missing, the old one's fields take the place of the deltas.
VESPRUN_EXPORT PropertyDict CopySMagNANDFTLInfo(std::uint64_t hours, std::uint32_t deltaWanted,
                                                std::uint32_t mode) noexcept;

/// The write amplification of garbage collection in each of the last six periods of four hours, the
/// latest first, estimated from the validity curve at the period's beginning: a double, or the
/// 32-bit number 0 when nothing was collected in the period or that is not known.
///
/// When the newest snapshot says that there is no stats magazine, the error text as
/// "com.quill.NANDInfo.ErrorMessage" instead. Else empty with `skipHistory` (not 0).
VESPRUN_EXPORT PropertyDict CopySMagNANDFTLCustomHistoryInfo(std::uint32_t skipHistory) noexcept;

}  // namespace vesprun
