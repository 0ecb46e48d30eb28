#pragma once

#include <cstdint>

#include "common/PropertyDict.h"

namespace vesprun {

/// What happened between the stats-magazine snapshot of `hours` hours ago and the newest one.
///
/// With `deltaWanted` (not 0) the counters that accumulate are reported as what they grew by, or as
/// the old snapshot has them when no time lies between the two; without it always as the old one
/// has them. In any case as doubles, when `mode` is 0 or 2. The values that are instantaneous come
/// from the old snapshot unchanged, when `mode` is 1 or 2. With any other mode there are neither.
///
/// In this order: "com.quill.NANDInfo.IsStatMagSupported"; when both snapshots have a time stamp
/// "HLT_SM_deltaDays", a double, and the fields that both have, in the old one's order; the derived
/// fields (`gatherORUFTLOtherData`) of the newest snapshot; the average P/E cycles "of the period",
/// doubles made from the erase counters above and the partitions of now; "HLT_APIErrorMessage".
/// When the newest snapshot is missing, the old one's fields stand in place of the deltas.
PropertyDict CopySMagNANDFTLInfo(std::uint64_t hours, std::uint32_t deltaWanted,
                                 std::uint32_t mode);

}  // namespace vesprun
