#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyDict.h"
#include "platform/EventHub.h"

namespace vesprun {

/// What each step of the extraction sends, by its index. The last one only has a name.
inline constexpr std::array<std::string_view, 8> kEH_Extraction_Step_Names{
    "FTL big view",       "MSP stats",           "storage stats",        "NVRAM stat",
    "FTL statsMag daily", "FTL statsMag weekly", "FTL statsMag monthly", "FTL counters"};

/// Offers an event to the event service; true when it took the offer.
bool EventHubSendEventLazyWrapper(std::string_view event, const EventHub::PayloadBuilder& build);

/// Sends the storage statistics as analytics events, step by step from `firstStep` to 6, the last
/// one only with `allowMonthly`. Each step is told in the system log, at default level.
///
/// With `collectResults` (not 0) the payloads of all steps in one dictionary, later entries in
/// place of earlier ones of the same key: those of events that the service took, whether or not it
/// wanted them, and the NVRAM statistics. The MSPs' payloads are one entry, "msp_index", that of
/// the last MSP whose event was taken. "com.quill.NANDInfo.ErrorMessage" is the first error text of
/// the process. Otherwise nothing. The first argument is not consulted.
///
/// From step 7, which only has a name, that step's failure is recorded; from a later one nothing
/// is done.
std::optional<PropertyDict> NandInfoExtractToEH_runAllSteps(std::uint64_t context,
                                                            bool allowMonthly,
                                                            std::uint32_t collectResults,
                                                            std::uint32_t firstStep);

}  // namespace vesprun
