#pragma once

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

// The fields of each set of storage statistics, and their significant digits when the set is
// rounded.
extern const FieldTable WhitelistedRawNANDFTLCounters_SigDigDict;  ///< the FTL set
extern const FieldTable WhitelistedRawNANDMSPCounters_SigDigDict;  ///< the set of one MSP
extern const FieldTable WhitelistedStorageStats_SigDigDict;        ///< the storage statistics

/// The derived fields in the sets of the MSPs, in this order.
extern const FieldTable FTLStats4MSPStats;

}  // namespace vesprun
