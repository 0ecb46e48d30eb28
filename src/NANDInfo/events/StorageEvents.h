#pragma once

#include <cstdint>

#include "vesprun/PropertyDict.h"

namespace vesprun {

// Steps of the event extraction. They send unrounded statistics and return one dictionary of the
// payloads that the event service took, or only "com.quill.NANDInfo.ErrorMessage" when there was
// nothing to send.

/// One event of FTL counters, two of FTL histograms.
PropertyDict createAndLogFTLStatFieldsToEventHubForEvent();

/// An event for each MSP: the fields of its set, "msp_index" (text) and "total_nof_msps". The
/// result has the last payload taken as "msp_index"; an event that is not taken is recorded as an
/// error.
PropertyDict createAndLogMSPFieldsToEventHubForEvent();

PropertyDict createAndLogStorageStatsToEventHubForEvent();

/// The stats magazine's view of a day (0, also with its history), a week (1)
/// or a month (2).
PropertyDict createAndLogSMagFTLFieldsToEventHubForEvent(std::uint32_t view);

}  // namespace vesprun
