#include "NANDInfo/events/EventExtraction.h"

#include <string>

#include "NANDInfo/controller/EntryPoint.h"
#include "NANDInfo/events/MagazineEvents.h"
#include "NANDInfo/events/StatisticsEvents.h"
#include "NANDInfo/parsers/APIErrorMessage.h"
#include "platform/Platform.h"
#include "telemetry/NVRAMStatistics.h"

namespace vesprun {
namespace {

constexpr std::uint32_t kMonthlyStep = 6;

/// Nothing for a step that is only a name.
std::optional<PropertyDict> resultOfStep(std::uint32_t step) {
  switch (step) {
    case 0:
      return createAndLogFTLStatFieldsToEventHubForEvent();
    case 1:
      return createAndLogMSPFieldsToEventHubForEvent();
    case 2:
      return createAndLogStorageStatsToEventHubForEvent();
    case 3:
      return gatherNVRAMStats();
    case 4:
    case 5:
    case kMonthlyStep:
      return createAndLogSMagFTLFieldsToEventHubForEvent(step - 4);
    default:
      return std::nullopt;
  }
}

std::optional<PropertyDict> runStep(std::uint32_t step) {
  if (!platform().eventHub().sendEventLazyIsAvailable()) {
    return PropertyDict{
        {std::string(kNANDInfoErrorMessageKey), "Unable call EH API EventHubSendEventLazy"}};
  }
  const char* name = kEH_Extraction_Step_Names[step].data();
  logMessage(LogLevel::Default, "NANDInfo: NandInfoExtractToEH_runStep: logging %s\n", name);
  std::optional<PropertyDict> result = resultOfStep(step);
  if (result) {
    logMessage(LogLevel::Default, "NANDInfo: NandInfoExtractToEH_runStep: successfully logged %s\n",
               name);
  } else {
    SetAPIErrorMessage("%s: unable to log %s to EH", "NANDInfo", name);
    logMessage(LogLevel::Default, "NANDInfo: NandInfoExtractToEH_runStep: unable to log %s\n",
               name);
  }
  return result;
}

}  // namespace

bool EventHubSendEventLazyWrapper(std::string_view event, const EventHub::PayloadBuilder& build) {
  return platform().eventHub().EventHubSendEventLazy(event, build);
}

std::optional<PropertyDict> NandInfoExtractToEH_runAllSteps(std::uint64_t /*context*/,
                                                            bool allowMonthly,
                                                            std::uint32_t collectResults,
                                                            std::uint32_t firstStep) noexcept {
  return runEntryPoint(__func__, [&]() -> std::optional<PropertyDict> {
    PropertyDict results;
    for (std::uint32_t step = firstStep; step < kEH_Extraction_Step_Names.size(); ++step) {
      if (step == kMonthlyStep && !allowMonthly) {
        logMessage(LogLevel::Default, "Skipping Stats Mag Monthly Delta");
        break;
      }
      const std::optional<PropertyDict> result = runStep(step);
      if (result && collectResults != 0) {
        results.merge(*result);
      }
      if (step == kMonthlyStep) {
        break;
      }
    }
    if (collectResults == 0) {
      return std::nullopt;
    }
    results.set(kNANDInfoErrorMessageKey, GetAPIErrorMessage());
    return results;
  });
}

}  // namespace vesprun
