#pragma once

#include <cstdint>

#include "Export.h"
#include "PropertyDict.h"

namespace vesprun {

// The stats magazine: FTL fields, saved every four hours.

/// What happened since the snapshot of `hours` hours ago (low 32 bits).
///
/// Accumulating counters, doubles, are reported if `mode` is 0 or 2: their growth with
/// `deltaWanted` (not 0) if the snapshots' time stamps differ, else the old values. Instantaneous
/// values of the old snapshot are reported if `mode` is 1 or 2.
///
/// In this order: "com.quill.NANDInfo.IsStatMagSupported"; if both snapshots have a time stamp
/// "HLT_SM_deltaDays", a double, and the fields that both have, in the old one's order; the fields
/// derived from the newest snapshot; the period's average P/E cycles, doubles made from the erase
/// counters above and the current partitions; "HLT_APIErrorMessage". Without the newest snapshot,
/// the old one's fields replace the deltas.
VESPRUN_EXPORT PropertyDict CopySMagNANDFTLInfo(std::uint64_t hours, std::uint32_t deltaWanted,
                                                std::uint32_t mode) noexcept;

/// The write amplification of garbage collection in the last six periods of four hours, latest
/// first, estimated from the validity curve at each period's beginning: a double, or the 32-bit
/// number 0 when nothing was collected or it is unknown.
///
/// If the newest snapshot has no stats magazine: the error text as
/// "com.quill.NANDInfo.ErrorMessage". Else empty with `skipHistory` (not 0).
VESPRUN_EXPORT PropertyDict CopySMagNANDFTLCustomHistoryInfo(std::uint32_t skipHistory) noexcept;

}  // namespace vesprun
