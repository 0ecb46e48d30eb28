#pragma once

#include <cstdint>

#include "../Export.h"

namespace vesprun {

// Inputs and results of the daily structured storage log, 0 in a new process. Others may set only
// `gForceCollectionSet`.

/// Not 0: always collect the validity list.
VESPRUN_EXPORT extern std::uint8_t gForceCollectionSet;
/// Not 0: the validity list is wanted now.
VESPRUN_EXPORT extern std::uint8_t gNeedValidityList;
/// Write amplification of the user partition, in single precision.
VESPRUN_EXPORT extern double gCurrentUserWamp;
/// Of the intermediate partition.
VESPRUN_EXPORT extern double gCurrentSysWamp;

}  // namespace vesprun
