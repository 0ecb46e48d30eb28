#pragma once

#include <cstdint>
#include <optional>

#include "Export.h"
#include "PropertyDict.h"

namespace vesprun {

/// Sends the storage statistics as analytics events: steps `firstStep` to 6, the last one only with
/// `allowMonthly`. Each step is logged at default level. Step 7 has only a name, and records an
/// error. From step 8 on nothing happens. `context` is ignored.
///
/// Empty if `collectResults` is 0. Else one dictionary of the payloads that the service
/// took, wanted or not, and the NVRAM statistics; a later entry replaces an earlier one of its key.
/// "msp_index" is the payload of the last MSP taken, "com.quill.NANDInfo.ErrorMessage" the first
/// error text of the process.
VESPRUN_EXPORT std::optional<PropertyDict> NandInfoExtractToEH_runAllSteps(
    std::uint64_t context, bool allowMonthly, std::uint32_t collectResults,
    std::uint32_t firstStep) noexcept;

}  // namespace vesprun
