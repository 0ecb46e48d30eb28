#include "driver/DailyTasks.h"

#include "driver/DailyStorageAndDeviceStats.h"
#include "driver/TaskingSync.h"
#include "platform/Guarded.h"
#include "platform/Platform.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

/// Seconds: more than a day's work takes, but a stopped process must not block the others forever.
constexpr double kMaxWaitForOthers = 300;

bool lockDailyWork() { return platform().fileSystem().lockDailyWork(kMaxWaitForOthers); }

std::int32_t yesterday() { return dayBefore(platform().tallybook().TBDaysSince1970()); }

bool isDoneFor(std::int32_t day) {
  return platform().preferences().LGSPreferencesGetIntegerValue(kStoredDayKey, kOwnDomain) >= day;
}

void runTasks(std::int32_t day, const AppInfoList* appInfo) {
  logMessage(LogLevel::Default, "daily tasks for day %d", day);
  const auto checkpoint = [] { platform().tallybook().TBClientCheckpoint(); };
  runGuarded(checkpoint);
  runGuarded([day, appInfo] {
    if (platform().logsmith().DiagnosticLogSubmissionEnabled()) {
      TBReport().writeLogForYesterdayWithAppInfo(day, appInfo);
    }
  });
  LogDailyStorageAndDeviceStats();  // guards its own steps
  runGuarded([] { platform().logsmith().FLDumpAllOldStructuredDataLogs(); });
  runGuarded(syncTaskingAndOSChange);
  runGuarded([] { platform().logsmith().rollTendmarkLogs(); });
  // Before the day is stored: a run that is killed must not lose what the tasks counted.
  runGuarded(checkpoint);
}

/// For a process that holds the lock.
bool isStillDue(std::int32_t day) {
  // Forgets what was read before another process may have stored the day.
  platform().preferences().LGSPreferencesSynchronize(kOwnDomain);
  return !isDoneFor(day);
}

}  // namespace

std::int32_t dayBefore(std::int32_t day) {
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(day) - 1U);
}

void runDayCheck(const AppInfoList* appInfo) {
  if (!isDoneFor(yesterday())) {
    if (!lockDailyWork()) {
      return;
    }
    const std::int32_t day = yesterday();
    if (isStillDue(day)) {
      runTasks(day, appInfo);
      runGuarded([day] {
        platform().preferences().LGSPreferencesSetValue(kStoredDayKey, day, kOwnDomain);
        platform().preferences().LGSPreferencesSynchronize(kOwnDomain);
      });
      return;
    }
  }
  logMessage(LogLevel::Default, "Day unchanged since last run");
}

void runDailyTasks(std::int32_t day, const AppInfoList* appInfo) {
  if (lockDailyWork()) {
    runTasks(day, appInfo);
  }
}

}  // namespace vesprun
