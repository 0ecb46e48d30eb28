#pragma once

#include <cstdint>

#include "common/PropertyDict.h"

namespace vesprun {

/// Sends what the stats magazine tells of a period as an event: of a day (view 0), with the history
/// of `CopySMagNANDFTLCustomHistoryInfo`, of a week (1) or of a month (2). The payload when the
/// event service took it, else empty. With any other view, or without a stats magazine, only
/// "com.quill.NANDInfo.ErrorMessage" that tells so.
PropertyDict createAndLogSMagFTLFieldsToEventHubForEvent(std::uint32_t view);

}  // namespace vesprun
