#include "NANDInfo/events/StatisticsEvents.h"

#include <cstdint>
#include <string>

#include "NANDInfo/WhitelistedFieldSets.h"
#include "NANDInfo/events/EventExtraction.h"
#include "NANDInfo/parsers/APIErrorMessage.h"
#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/tables/EventFields.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

/// An event, the operation that sends it and the name of its view, for the log. Without a view the
/// outcome is not logged.
struct StatisticsEvent {
  const char* operation;
  const char* event;
  const char* view;
};

constexpr const char* kFTLOperation = "createAndLogFTLStatFieldsToEventHubForEvent";
constexpr StatisticsEvent kFTLEvents[] = {
    {kFTLOperation, "com.quill.massStorage.NANDInfo.FTLCounters_1",
     "massStorage_NANDInfo_FTLCounters_1"},
    {kFTLOperation, "com.quill.massStorage.NANDInfo.FTLHistograms_1",
     "massStorage_NANDInfo_FTLHistograms_1"},
    {kFTLOperation, "com.quill.massStorage.NANDInfo.FTLHistograms_2", nullptr},
};
constexpr StatisticsEvent kMSPEvent{"createAndLogMSPFieldsToEventHubForEvent",
                                    "com.quill.massStorage.NANDInfo.MSPCounters_1",
                                    "massStorage_NANDInfo_MSPCounters_1"};
constexpr StatisticsEvent kStorageStatsEvent{"createAndLogStorageStatsToEventHubForEvent",
                                             "com.quill.massStorage.NANDInfo.StorageStats_1",
                                             "massStorage_NANDInfo_StorageStats_1"};

void logWhetherUsed(const StatisticsEvent& event) {
  logMessage(LogLevel::Default, "NANDInfo: %s: %s enabled=%d\n", event.operation, event.event,
             platform().eventHub().EventHubIsEventUsed(event.event) ? 1 : 0);
}

PropertyDict payloadOf(const StatisticsEvent& event, const PropertyDict& set) {
  return CreateFilteredDict(set, &fieldsOfEvent(event.event));
}

bool sendAndLog(const StatisticsEvent& event, const PropertyDict& payload) {
  const bool sent = EventHubSendEventLazyWrapper(event.event, [&payload] { return payload; });
  if (event.view != nullptr) {
    logMessage(LogLevel::Default, "NANDInfo: %s: %s %s using EventHubSendEventLazy\n",
               event.operation, sent ? "SUCCESS in logging" : "FAILED to log", event.view);
  }
  return sent;
}

}  // namespace

PropertyDict createAndLogFTLStatFieldsToEventHubForEvent() {
  const PropertyDict set = CopyWhitelistedNANDFTLInfo(false);
  if (set.empty()) {
    return {{std::string(kNANDInfoErrorMessageKey), "Unable gather FTL fields to log to EH"}};
  }
  PropertyDict result;
  for (const StatisticsEvent& event : kFTLEvents) {
    logWhetherUsed(event);
    const PropertyDict payload = payloadOf(event, set);
    if (sendAndLog(event, payload)) {
      result.merge(payload);
    }
  }
  return result;
}

PropertyDict createAndLogMSPFieldsToEventHubForEvent() {
  PropertyDict sets = CopyWhitelistedNANDMSPInfo(false);
  if (sets.empty()) {
    return {{std::string(kNANDInfoErrorMessageKey), "Unable gather MSP fields to log to EH"}};
  }
  sets.remove(kAPIErrorMessageKey);
  logWhetherUsed(kMSPEvent);
  const std::size_t total = sets.size();
  PropertyDict result;
  for (const auto& [index, set] : sets) {
    PropertyDict payload = payloadOf(kMSPEvent, *set.dict());
    payload.set("msp_index", index);
    payload.set("total_nof_msps", std::uint64_t{total});
    if (sendAndLog(kMSPEvent, payload)) {
      result.set("msp_index", std::move(payload));
    } else {
      SetAPIErrorMessage(
          "createAndLogMSPFieldsToEventHubForEvent: EventHubSendEventLazy failed to log to EH");
    }
  }
  logMessage(LogLevel::Default, "NANDInfo: %s: %s completed (total_nof_msps:%zu)\n",
             kMSPEvent.operation, kMSPEvent.event, total);
  return result;
}

PropertyDict createAndLogStorageStatsToEventHubForEvent() {
  const PropertyDict set = CopyWhitelistedStorageStats(false);
  if (set.empty()) {
    return {{std::string(kNANDInfoErrorMessageKey), "Unable gather Storage fields to log to EH"}};
  }
  logWhetherUsed(kStorageStatsEvent);
  PropertyDict payload = payloadOf(kStorageStatsEvent, set);
  return sendAndLog(kStorageStatsEvent, payload) ? payload : PropertyDict();
}

}  // namespace vesprun
