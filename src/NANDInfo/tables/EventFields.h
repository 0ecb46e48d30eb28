#pragma once

#include <array>
#include <string_view>

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

// The fields that each analytics event may carry, under the name of the event's view.
extern const FieldTable massStorage_NANDInfo_FTLCounters_1;              ///< 443
extern const FieldTable massStorage_NANDInfo_FTLHistograms_1;            ///< 990
extern const FieldTable massStorage_NANDInfo_FTLHistograms_2;            ///< 104
extern const FieldTable massStorage_NANDInfo_MSPCounters_1;              ///< 822
extern const FieldTable massStorage_NANDInfo_StorageStats_1;             ///< 17
extern const FieldTable massStorage_NANDInfo_SM_Daily_FTLCounters_1;     ///< 52
extern const FieldTable massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1;  ///< 33
extern const FieldTable massStorage_NANDInfo_SM_Monthly_FTLCounters_1;   ///< 33

struct EventFields {
  std::string_view event;  ///< "com.quill.massStorage.NANDInfo." and what kind of event it is
  const FieldTable* fields;
};

/// Every storage event with its fields, in the order in which the events are sent.
extern const std::array<EventFields, 8> EventHubConfigDetails;

/// The fields of the event of that name; an event that is not known may carry nothing.
const FieldTable& fieldsOfEvent(std::string_view event);

}  // namespace vesprun
