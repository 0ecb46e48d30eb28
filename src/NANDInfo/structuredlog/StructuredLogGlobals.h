#pragma once

#include <cstdint>

namespace vesprun {

// Input and results of the structured log, which "vesprun/StructuredLogState.h" gives to programs.

extern std::uint8_t gForceCollectionSet;
extern std::uint8_t gNeedValidityList;
extern double gCurrentUserWamp;
extern double gCurrentSysWamp;

}  // namespace vesprun
