#pragma once

#include <optional>
#include <string_view>
#include <vector>

#include "report/TBReport.h"

namespace vesprun {

// What the daily log measures itself. Adding it to a report changes nothing on the device; what a
// submitted report changes beside has a function of its own.

/// The keys of the scalars, on every device and in the order in which they are added.
std::vector<std::string_view> ownScalarKeys();

struct InstalledAppCounts {
  std::int64_t all = 0;
  std::int64_t thirdParty = 0;
};

/// "com.quill.homeshell.numAllInstalledApps" and ".numThirdPartyApps". Nothing is counted when
/// nobody asks, neither the whitelist nor the event service.
std::optional<InstalledAppCounts> addInstalledAppInfo(TBReport& report);

/// Offers the counts as event "com.quill.homeshell.appInstalls".
void offerAppInstallsEvent(const InstalledAppCounts& counts);

/// Language and region, whitelisted or not.
void addMetadataKeys(PropertyDict& metadata);

/// "com.quill.logsmith.tlyd.database.size": MiB of the counter database, −1 when it cannot be
/// examined. "com.quill.logsmith.tlyd.database.corruptions": the count since the last report; 0
/// when the functions that read and reset it cannot be resolved. True when it was read.
bool reportDatabaseSize(TBReport& report);

/// Lets the count of corruptions, which has been reported, start from 0.
void restartCorruptionCount();

/// "com.quill.usage.cur_boot_session_cpu_uptime": minutes awake since boot, −1 without the ratio of
/// the kernel's ticks.
void reportCPUUptime(TBReport& report);

}  // namespace vesprun
