#pragma once

#include <cstdint>
#include <optional>

#include "../Export.h"
#include "../common/PropertyDict.h"

namespace vesprun {

/// Sends the storage statistics as analytics events, step by step from `firstStep` to 6, the last
/// one only with `allowMonthly`. Each step is logged, at default level. From step 7, which only has
/// a name, that step's failure is recorded; from a later one nothing is done. `context` is not
/// consulted.
///
/// With `collectResults` (not 0) the payloads of all steps in one dictionary, later entries in
/// place of earlier ones of the same key: those of events that the service took, whether or not it
/// wanted them, and the NVRAM statistics. The MSPs' payloads are one entry, "msp_index", that of
/// the last MSP whose event was taken. "com.quill.NANDInfo.ErrorMessage" is the first error text of
/// the process. Nothing with `collectResults` 0.
VESPRUN_EXPORT std::optional<PropertyDict> NandInfoExtractToEH_runAllSteps(
    std::uint64_t context, bool allowMonthly, std::uint32_t collectResults,
    std::uint32_t firstStep) noexcept;

}  // namespace vesprun
