#include "driver/DailyTasks.h"

#include <string_view>

#include "driver/Guarded.h"
#include "driver/TaskingSync.h"
#include "platform/Platform.h"
#include "platform/PreferenceNames.h"
#include "report/TBReport.h"
#include "telemetry/DailyStorageAndDeviceStats.h"

namespace vesprun {
namespace {

constexpr std::string_view kStoredDayKey = "LastCrashLogSerializationDateInDaysSince1970";

}  // namespace

std::int32_t dayBefore(std::int32_t day) {
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(day) - 1U);
}

void runDayCheck(const AppInfoList* appInfo) {
  const std::int32_t yesterday = dayBefore(platform().tallybook().TBDaysSince1970());
  Preferences& preferences = platform().preferences();
  const std::int64_t last = preferences.LGSPreferencesGetIntegerValue(kStoredDayKey, kOwnDomain);
  if (last >= yesterday) {
    logMessage(LogLevel::Default, "Day unchanged since last run");
    return;
  }
  runDailyTasks(yesterday, appInfo);
  preferences.LGSPreferencesSetValue(kStoredDayKey, yesterday, kOwnDomain);
  preferences.LGSPreferencesSynchronize(kOwnDomain);
}

void runDailyTasks(std::int32_t day, const AppInfoList* appInfo) {
  logMessage(LogLevel::Default, "daily tasks for day %d", day);
  const auto checkpoint = [] { platform().tallybook().TBClientCheckpoint(); };
  runGuarded(checkpoint);
  runGuarded([day, appInfo] {
    if (platform().logsmith().DiagnosticLogSubmissionEnabled()) {
      TBReport().writeLogForYesterdayWithAppInfo(day, appInfo);
    }
  });
  runGuarded(LogDailyStorageAndDeviceStats);
  runGuarded([] { platform().logsmith().FLDumpAllOldStructuredDataLogs(); });
  runGuarded(syncTaskingAndOSChange);
  runGuarded([] { platform().logsmith().rollTendmarkLogs(); });
  // Before the day is stored: a run that is killed must not lose what the tasks counted.
  runGuarded(checkpoint);
}

}  // namespace vesprun
