#include "NANDInfo/events/MagazineEvents.h"

#include <iterator>
#include <string>

#include "NANDInfo/Magazine.h"
#include "NANDInfo/events/EventExtraction.h"
#include "NANDInfo/parsers/APIErrorMessage.h"
#include "NANDInfo/sets/FieldNumber.h"
#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/sets/MagazineSnapshot.h"
#include "NANDInfo/tables/EventFields.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr const char* kOperation = "createAndLogSMagFTLFieldsToEventHubForEvent";

struct MagazineView {
  const char* event;
  const char* view;  ///< the event's name in the log line on its outcome
  std::uint64_t hours;
  bool withHistory;
};

constexpr MagazineView kMagazineViews[] = {
    {"com.quill.massStorage.NANDInfo.SM.Daily.FTLCounters_1",
     "massStorage_NANDInfo_SM_Daily_FTLCounters_1", 24, true},
    {"com.quill.massStorage.NANDInfo.SM.WeeklyMA.FTLCounters_1",
     "massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1", 168, false},
    {"com.quill.massStorage.NANDInfo.SM.Monthly.FTLCounters_1",
     "massStorage_NANDInfo_SM_Monthly_FTLCounters_1", 720, false},
};

}  // namespace

PropertyDict createAndLogSMagFTLFieldsToEventHubForEvent(std::uint32_t view) {
  if (view >= std::size(kMagazineViews)) {
    logMessage(LogLevel::Default, "Unexpected SM delta type %d", static_cast<std::int32_t>(view));
    return {{std::string(kNANDInfoErrorMessageKey), "Wrong SM delta type"}};
  }
  const auto& [event, viewName, hours, withHistory] = kMagazineViews[view];
  const PropertyDict fields = CopySMagNANDFTLInfo(hours, 1, 2);
  if (fields.empty()) {
    return {{std::string(kNANDInfoErrorMessageKey), "Unable gather FTL fields to log to EH"}};
  }
  const Number* isSupported = numberUnder(fields, kIsStatMagSupportedKey);
  if (isSupported == nullptr || isSupported->asInt32() == 0) {
    return {{std::string(kNANDInfoErrorMessageKey), "Stats Magazine not supported"}};
  }
  logMessage(LogLevel::Default, "NANDInfo: %s: %s enabled=%d\n", kOperation, event,
             platform().eventHub().EventHubIsEventUsed(event) ? 1 : 0);
  PropertyDict payload = CreateFilteredDict(fields, &fieldsOfEvent(event));
  if (withHistory) {
    payload.merge(CopySMagNANDFTLCustomHistoryInfo(0));
  }
  const bool sent = EventHubSendEventLazyWrapper(event, [&payload] { return payload; });
  logMessage(LogLevel::Default, "NANDInfo: %s: %s %s using EventHubSendEventLazy\n", kOperation,
             sent ? "SUCCESS in logging" : "FAILED to log", viewName);
  return sent ? payload : PropertyDict();
}

}  // namespace vesprun
