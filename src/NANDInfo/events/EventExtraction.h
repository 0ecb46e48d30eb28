#pragma once

#include <array>
#include <string_view>

#include "NANDInfo/EventExtraction.h"
#include "platform/EventHub.h"

namespace vesprun {

/// What each step of the extraction sends, by its index. The last one only has a name.
inline constexpr std::array<std::string_view, 8> kEH_Extraction_Step_Names{
    "FTL big view",       "MSP stats",           "storage stats",        "NVRAM stat",
    "FTL statsMag daily", "FTL statsMag weekly", "FTL statsMag monthly", "FTL counters"};

/// Offers an event to the event service; true when it took the offer.
bool EventHubSendEventLazyWrapper(std::string_view event, const EventHub::PayloadBuilder& build);

}  // namespace vesprun
