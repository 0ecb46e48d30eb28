#pragma once

#include <optional>
#include <string_view>
#include <vector>

#include "report/TBReport.h"

namespace vesprun {

// The daily log's own sources. Adding them to a report changes nothing on the device; functions of
// their own do what only a submitted report does.

/// The keys of all their scalars, in the order in which they are added.
std::vector<std::string_view> ownScalarKeys();

struct InstalledAppCounts {
  std::int64_t all = 0;
  std::int64_t thirdParty = 0;
};

/// "com.quill.homeshell.numAllInstalledApps" and ".numThirdPartyApps". Counted only if the
/// whitelist or the event service asks.
std::optional<InstalledAppCounts> addInstalledAppInfo(TBReport& report);

/// Offers the counts as event "com.quill.homeshell.appInstalls".
void offerAppInstallsEvent(const InstalledAppCounts& counts);

/// Language and region, whitelisted or not.
void addMetadataKeys(PropertyDict& metadata);

/// "com.quill.logsmith.tlyd.database.size": MiB of the counter database, −1 if unknown.
/// "com.quill.logsmith.tlyd.database.corruptions": since the last report; 0 if the functions to
/// read and reset the count cannot be resolved. True when it was read.
bool reportDatabaseSize(TBReport& report);

/// Sets the count of corruptions, which has been reported, to 0.
void restartCorruptionCount();

/// "com.quill.usage.cur_boot_session_cpu_uptime": minutes awake since boot, −1 without a tick
/// ratio.
void reportCPUUptime(TBReport& report);

}  // namespace vesprun
