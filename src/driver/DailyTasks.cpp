#include "driver/DailyTasks.h"

#include <string_view>

#include "driver/TaskingSync.h"
#include "platform/Platform.h"
#include "report/TBReport.h"
#include "telemetry/DailyStorageAndDeviceStats.h"

namespace vesprun {
namespace {

constexpr std::string_view kDomain = "com.quill.aggregated.vesprun";
constexpr std::string_view kStoredDayKey = "LastCrashLogSerializationDateInDaysSince1970";

}  // namespace

std::int32_t dayBefore(std::int32_t day) {
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(day) - 1U);
}

void runDayCheck(const AppInfoList* appInfo) {
  const std::int32_t yesterday = dayBefore(platform().tallybook().TBDaysSince1970());
  Preferences& preferences = platform().preferences();
  const std::int64_t last = preferences.LGSPreferencesGetIntegerValue(kStoredDayKey, kDomain);
  if (last >= yesterday) {
    logMessage(LogLevel::Default, "Day unchanged since last run");
    return;
  }
  runDailyTasks(yesterday, appInfo);
  preferences.LGSPreferencesSetValue(kStoredDayKey, yesterday, kDomain);
  preferences.LGSPreferencesSynchronize(kDomain);
}

void runDailyTasks(std::int32_t day, const AppInfoList* appInfo) {
  logMessage(LogLevel::Default, "daily tasks for day %d", day);
  Tallybook& tallybook = platform().tallybook();
  tallybook.TBClientCheckpoint();
  Logsmith& logsmith = platform().logsmith();
  if (logsmith.DiagnosticLogSubmissionEnabled()) {
    TBReport().writeLogForYesterdayWithAppInfo(day, appInfo);
  }
  LogDailyStorageAndDeviceStats();
  logsmith.FLDumpAllOldStructuredDataLogs();
  syncTaskingAndOSChange();
  logsmith.rollTendmarkLogs();
  // Before the day is stored: a run that is killed must not lose what the tasks counted.
  tallybook.TBClientCheckpoint();
}

}  // namespace vesprun
