#pragma once

#include <cstdint>

#include "../Export.h"

namespace vesprun {

// What the structured storage log of the daily job decides by and finds out. All are 0 in a new
// process; only `gForceCollectionSet` is for others to set.

/// Not 0: the validity list is always collected.
VESPRUN_EXPORT extern std::uint8_t gForceCollectionSet;
/// Not 0: the validity list is wanted in this run.
VESPRUN_EXPORT extern std::uint8_t gNeedValidityList;
/// Write amplification of the user partition, a value of single precision.
VESPRUN_EXPORT extern double gCurrentUserWamp;
/// And of the intermediate partition.
VESPRUN_EXPORT extern double gCurrentSysWamp;

}  // namespace vesprun
