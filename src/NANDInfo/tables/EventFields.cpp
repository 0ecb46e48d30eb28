#include "NANDInfo/tables/EventFields.h"

#include <algorithm>

namespace vesprun {

constinit const std::array<EventFields, 8> EventHubConfigDetails = {{
    {"com.quill.massStorage.NANDInfo.FTLCounters_1", &massStorage_NANDInfo_FTLCounters_1},
    {"com.quill.massStorage.NANDInfo.FTLHistograms_1", &massStorage_NANDInfo_FTLHistograms_1},
    {"com.quill.massStorage.NANDInfo.FTLHistograms_2", &massStorage_NANDInfo_FTLHistograms_2},
    {"com.quill.massStorage.NANDInfo.MSPCounters_1", &massStorage_NANDInfo_MSPCounters_1},
    {"com.quill.massStorage.NANDInfo.StorageStats_1", &massStorage_NANDInfo_StorageStats_1},
    {"com.quill.massStorage.NANDInfo.SM.Daily.FTLCounters_1",
     &massStorage_NANDInfo_SM_Daily_FTLCounters_1},
    {"com.quill.massStorage.NANDInfo.SM.WeeklyMA.FTLCounters_1",
     &massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1},
    {"com.quill.massStorage.NANDInfo.SM.Monthly.FTLCounters_1",
     &massStorage_NANDInfo_SM_Monthly_FTLCounters_1},
}};

const FieldTable& fieldsOfEvent(std::string_view event) {
  static constexpr std::array<FieldRange, 0> kNoRanges{};
  static constexpr FieldIndex kNoIndex(kNoRanges);
  static constexpr FieldTable kNothing(kNoRanges, kNoIndex);
  const auto* found = std::ranges::find(EventHubConfigDetails, event, &EventFields::event);
  return found != EventHubConfigDetails.end() ? *found->fields : kNothing;
}

}  // namespace vesprun
