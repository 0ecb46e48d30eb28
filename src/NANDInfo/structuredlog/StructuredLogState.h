#pragma once

#include <cstdint>

#include "vesprun/StructuredLogState.h"

namespace vesprun {

// The values behind the installed functions.

extern std::uint8_t gForceCollectionSet;
extern std::uint8_t gNeedValidityList;
extern double gCurrentUserWamp;
extern double gCurrentSysWamp;

}  // namespace vesprun
