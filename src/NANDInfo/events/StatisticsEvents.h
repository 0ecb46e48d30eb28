#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

// The steps of the event extraction that send the statistics of now, unrounded. Each result is what
// the step sent: the payloads that the event service took in one dictionary, possibly none.

/// The event of FTL counters, then the two of FTL histograms.
PropertyDict createAndLogFTLStatFieldsToEventHubForEvent();

/// One event for each MSP: the fields of its set with "msp_index", the text of its index, and
/// "total_nof_msps", how many there are. The result has the last payload that was taken, under
/// "msp_index". An event that is not taken is recorded as an error.
PropertyDict createAndLogMSPFieldsToEventHubForEvent();

/// The event of the storage statistics.
PropertyDict createAndLogStorageStatsToEventHubForEvent();

}  // namespace vesprun
