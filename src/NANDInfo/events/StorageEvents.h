#pragma once

#include <cstdint>

#include "common/PropertyDict.h"

namespace vesprun {

// The steps of the event extraction that send storage statistics, unrounded. The result is what the
// step sent: the payloads that the event service took in one dictionary, possibly none; or only
// "com.quill.NANDInfo.ErrorMessage" when there was nothing to send.

/// The event of FTL counters, then the two of FTL histograms.
PropertyDict createAndLogFTLStatFieldsToEventHubForEvent();

/// One event for each MSP: the fields of its set with "msp_index", the text of its index, and
/// "total_nof_msps", how many there are. The result has the last payload that was taken, under
/// "msp_index". An event that is not taken is recorded as an error.
PropertyDict createAndLogMSPFieldsToEventHubForEvent();

/// The event of the storage statistics.
PropertyDict createAndLogStorageStatsToEventHubForEvent();

/// What the stats magazine holds of a period: of a day (view 0), with the history of
/// `CopySMagNANDFTLCustomHistoryInfo`, of a week (1) or of a month (2).
PropertyDict createAndLogSMagFTLFieldsToEventHubForEvent(std::uint32_t view);

}  // namespace vesprun
