#pragma once

#include <cstdint>

namespace vesprun {

// What one structured storage log tells its list handlers. Written by `DumpStorageStructuredLog`,
// but for the first, which its caller may set.

extern std::uint8_t gForceCollectionSet;  ///< not 0: the validity list is always collected
extern std::uint8_t gNeedValidityList;    ///< not 0: the validity list is wanted in this run
extern double gCurrentUserWamp;  ///< write amplification of the user partition, a float's value
extern double gCurrentSysWamp;   ///< and of the intermediate partition

/// All four 0, as in a new process.
void forgetStructuredLogState();

}  // namespace vesprun
