#include "NANDInfo/events/StorageEvents.h"

#include <iterator>
#include <string>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/sets/MagazineInfo.h"
#include "NANDInfo/sets/StatisticsGathering.h"
#include "NANDInfo/sets/WhitelistedFields.h"
#include "NANDInfo/tables/EventFields.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

struct MagazineView {
  const StorageEvent& event;
  std::uint64_t hours;
  bool withHistory;
};

constexpr MagazineView kMagazineViews[] = {
    {eventOfStep(4), 24, true}, {eventOfStep(5), 168, false}, {eventOfStep(6), 720, false}};

PropertyDict failure(const char* text) { return {{std::string(kNANDInfoErrorMessageKey), text}}; }

bool EventHubSendEventLazyWrapper(const char* event, const EventHub::PayloadBuilder& build) {
  return platform().eventHub().EventHubSendEventLazy(event, build);
}

void logWhetherUsed(const char* operation, const StorageEvent& event) {
  logMessage(LogLevel::Default, "NANDInfo: %s: %s enabled=%d\n", operation, event.event,
             platform().eventHub().EventHubIsEventUsed(event.event) ? 1 : 0);
}

bool sendAndLog(const char* operation, const StorageEvent& event, const PropertyDict& payload) {
  const bool sent = EventHubSendEventLazyWrapper(event.event, [&payload] { return payload; });
  if (event.view != nullptr) {
    logMessage(LogLevel::Default, "NANDInfo: %s: %s %s using EventHubSendEventLazy\n", operation,
               sent ? "SUCCESS in logging" : "FAILED to log", event.view);
  }
  return sent;
}

}  // namespace

PropertyDict createAndLogFTLStatFieldsToEventHubForEvent() {
  const PropertyDict set = gatherWhitelistedFTLInfo(false);
  if (set.empty()) {
    return failure("Unable gather FTL fields to log to EH");
  }
  PropertyDict result;
  for (const StorageEvent& event : EventHubConfigDetails) {
    if (event.step != 0) {
      break;
    }
    logWhetherUsed(__func__, event);
    PropertyDict payload = CreateFilteredDict(set, event.fields);
    if (sendAndLog(__func__, event, payload)) {
      result.merge(std::move(payload));
    }
  }
  return result;
}

PropertyDict createAndLogMSPFieldsToEventHubForEvent() {
  constexpr const StorageEvent& kEvent = eventOfStep(1);
  PropertyDict sets = gatherWhitelistedMSPInfo(false);
  if (sets.empty()) {
    return failure("Unable gather MSP fields to log to EH");
  }
  sets.remove(kAPIErrorMessageKey);
  logWhetherUsed(__func__, kEvent);
  PropertyDict result;
  for (const auto& [index, set] : sets) {
    PropertyDict payload = CreateFilteredDict(*set.dict(), kEvent.fields);
    payload.set("msp_index", index);
    payload.set("total_nof_msps", std::uint64_t{sets.size()});
    if (sendAndLog(__func__, kEvent, payload)) {
      result.set("msp_index", std::move(payload));
    } else {
      SetAPIErrorMessage("%s: EventHubSendEventLazy failed to log to EH", __func__);
    }
  }
  logMessage(LogLevel::Default, "NANDInfo: %s: %s completed (total_nof_msps:%zu)\n", __func__,
             kEvent.event, sets.size());
  return result;
}

PropertyDict createAndLogStorageStatsToEventHubForEvent() {
  constexpr const StorageEvent& kEvent = eventOfStep(2);
  const PropertyDict set = gatherWhitelistedStorageStats(false);
  if (set.empty()) {
    return failure("Unable gather Storage fields to log to EH");
  }
  logWhetherUsed(__func__, kEvent);
  PropertyDict payload = CreateFilteredDict(set, kEvent.fields);
  return sendAndLog(__func__, kEvent, payload) ? std::move(payload) : PropertyDict();
}

PropertyDict createAndLogSMagFTLFieldsToEventHubForEvent(std::uint32_t view) {
  if (view >= std::size(kMagazineViews)) {
    logMessage(LogLevel::Default, "Unexpected SM delta type %d", static_cast<std::int32_t>(view));
    return failure("Wrong SM delta type");
  }
  const auto& [event, hours, withHistory] = kMagazineViews[view];
  const PropertyDict fields = gatherMagazineInfo(hours, true, 2);
  if (fields.empty()) {
    return failure("Unable gather FTL fields to log to EH");
  }
  const Number* isSupported = fields.findNumber(kIsStatMagSupportedKey);
  if (isSupported == nullptr || isSupported->asInt32() == 0) {
    return failure("Stats Magazine not supported");
  }
  logWhetherUsed(__func__, event);
  PropertyDict payload = CreateFilteredDict(fields, event.fields);
  if (withHistory) {
    payload.merge(gatherMagazineHistory(false));
  }
  return sendAndLog(__func__, event, payload) ? std::move(payload) : PropertyDict();
}

}  // namespace vesprun
