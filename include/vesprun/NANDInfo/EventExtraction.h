#pragma once

#include <cstdint>
#include <optional>

#include "../Export.h"
#include "../common/PropertyDict.h"

namespace vesprun {

/// Sends the storage statistics as analytics events: steps `firstStep` to 6, the last one only with
/// `allowMonthly`. Each step is logged at default level. Step 7 has only a name: its failure is
/// recorded. From step 8 on nothing happens. `context` is ignored.
///
/// With `collectResults` (not 0): the payloads of events that the service took, wanted or not, and
/// the NVRAM statistics, in one dictionary; a later entry replaces an earlier one of its key. The
/// payload of the last MSP taken is "msp_index". "com.quill.NANDInfo.ErrorMessage" is the first
/// error text of the process. Otherwise nothing.
VESPRUN_EXPORT std::optional<PropertyDict> NandInfoExtractToEH_runAllSteps(
    std::uint64_t context, bool allowMonthly, std::uint32_t collectResults,
    std::uint32_t firstStep) noexcept;

}  // namespace vesprun
