#pragma once

#include <array>
#include <cstdint>

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

// The fields of each analytics event, by its view.
extern const FieldTable massStorage_NANDInfo_FTLCounters_1;
extern const FieldTable massStorage_NANDInfo_FTLHistograms_1;
extern const FieldTable massStorage_NANDInfo_FTLHistograms_2;
extern const FieldTable massStorage_NANDInfo_MSPCounters_1;
extern const FieldTable massStorage_NANDInfo_StorageStats_1;
extern const FieldTable massStorage_NANDInfo_SM_Daily_FTLCounters_1;
extern const FieldTable massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1;
extern const FieldTable massStorage_NANDInfo_SM_Monthly_FTLCounters_1;

struct StorageEvent {
  const char* event;
  const char* view;    ///< named in the log line on the outcome; null: no line
  std::uint32_t step;  ///< of the extraction
  const FieldTable* fields;
};

/// Every storage event in sending order.
inline constexpr std::array<StorageEvent, 8> EventHubConfigDetails{{
    {"com.quill.massStorage.NANDInfo.FTLCounters_1", "massStorage_NANDInfo_FTLCounters_1", 0,
     &massStorage_NANDInfo_FTLCounters_1},
    {"com.quill.massStorage.NANDInfo.FTLHistograms_1", "massStorage_NANDInfo_FTLHistograms_1", 0,
     &massStorage_NANDInfo_FTLHistograms_1},
    {"com.quill.massStorage.NANDInfo.FTLHistograms_2", nullptr, 0,
     &massStorage_NANDInfo_FTLHistograms_2},
    {"com.quill.massStorage.NANDInfo.MSPCounters_1", "massStorage_NANDInfo_MSPCounters_1", 1,
     &massStorage_NANDInfo_MSPCounters_1},
    {"com.quill.massStorage.NANDInfo.StorageStats_1", "massStorage_NANDInfo_StorageStats_1", 2,
     &massStorage_NANDInfo_StorageStats_1},
    {"com.quill.massStorage.NANDInfo.SM.Daily.FTLCounters_1",
     "massStorage_NANDInfo_SM_Daily_FTLCounters_1", 4,
     &massStorage_NANDInfo_SM_Daily_FTLCounters_1},
    {"com.quill.massStorage.NANDInfo.SM.WeeklyMA.FTLCounters_1",
     "massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1", 5,
     &massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1},
    {"com.quill.massStorage.NANDInfo.SM.Monthly.FTLCounters_1",
     "massStorage_NANDInfo_SM_Monthly_FTLCounters_1", 6,
     &massStorage_NANDInfo_SM_Monthly_FTLCounters_1},
}};

/// Does not compile for a step without an event.
consteval const StorageEvent& eventOfStep(std::uint32_t step) {
  for (const StorageEvent& event : EventHubConfigDetails) {
    if (event.step == step) {
      return event;
    }
  }
  throw "no event of that step";
}

}  // namespace vesprun
