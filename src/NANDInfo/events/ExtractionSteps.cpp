#include "NANDInfo/events/ExtractionSteps.h"

#include <array>
#include <string>
#include <utility>

#include "NANDInfo/events/StorageEvents.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "platform/Platform.h"
#include "telemetry/NVRAMStatistics.h"

namespace vesprun {
namespace {

/// The last step has nothing but its name.
constexpr std::array kEH_Extraction_Step_Names{
    "FTL big view",       "MSP stats",           "storage stats",        "NVRAM stat",
    "FTL statsMag daily", "FTL statsMag weekly", "FTL statsMag monthly", "FTL counters"};

constexpr std::uint32_t kDailyStep = 4;
constexpr std::uint32_t kMonthlyStep = 6;

/// Nothing for a step that has only a name.
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
    case kDailyStep:
    case kDailyStep + 1:
    case kMonthlyStep:
      return createAndLogSMagFTLFieldsToEventHubForEvent(step - kDailyStep);
    default:
      return std::nullopt;
  }
}

std::optional<PropertyDict> runStep(std::uint32_t step) {
  if (!platform().eventHub().sendEventLazyIsAvailable()) {
    return PropertyDict{
        {std::string(kNANDInfoErrorMessageKey), "Unable call EH API EventHubSendEventLazy"}};
  }
  const char* name = kEH_Extraction_Step_Names[step];
  logMessage(LogLevel::Default, "NANDInfo: NandInfoExtractToEH_runStep: logging %s\n", name);
  std::optional<PropertyDict> result = resultOfStep(step);
  if (!result) {
    SetAPIErrorMessage("%s: unable to log %s to EH", "NANDInfo", name);
  }
  logMessage(LogLevel::Default, "NANDInfo: NandInfoExtractToEH_runStep: %s %s\n",
             result ? "successfully logged" : "unable to log", name);
  return result;
}

}  // namespace

std::optional<PropertyDict> runExtractionSteps(bool allowMonthly, bool collectResults,
                                               std::uint32_t firstStep) {
  PropertyDict results;
  for (std::uint32_t step = firstStep; step < kEH_Extraction_Step_Names.size(); ++step) {
    if (step == kMonthlyStep && !allowMonthly) {
      logMessage(LogLevel::Default, "Skipping Stats Mag Monthly Delta");
      break;
    }
    if (std::optional<PropertyDict> result = runStep(step)) {
      results.merge(*std::move(result));
    }
    if (step == kMonthlyStep) {
      break;
    }
  }
  if (!collectResults) {
    return std::nullopt;
  }
  results.set(kNANDInfoErrorMessageKey, GetAPIErrorMessage());
  return results;
}

}  // namespace vesprun
