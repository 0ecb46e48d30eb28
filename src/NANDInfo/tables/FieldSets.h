#pragma once

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

// The fields that a set of storage statistics may carry, and how many significant decimal digits
// each keeps when the set is rounded.
extern const FieldTable WhitelistedRawNANDFTLCounters_SigDigDict;  ///< 1447: the FTL set
extern const FieldTable WhitelistedRawNANDMSPCounters_SigDigDict;  ///< 825: the set of one MSP
extern const FieldTable WhitelistedStorageStats_SigDigDict;        ///< 20: the storage statistics

/// 30: the derived fields that go with the sets of the MSPs, in this order.
extern const FieldTable FTLStats4MSPStats;

}  // namespace vesprun
