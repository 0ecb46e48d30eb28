#pragma once

#include "report/TBReport.h"

namespace vesprun {

// What the daily log measures itself.

/// "com.quill.homeshell.numAllInstalledApps" and ".numThirdPartyApps", also offered as the event
/// "com.quill.homeshell.appInstalls". Nothing is counted when nobody asks.
void addInstalledAppInfo(TBReport& report);

/// Language and region, whitelisted or not.
void addMetadataKeys(PropertyDict& metadata);

/// "com.quill.logsmith.tlyd.database.size": MiB of the counter database, −1 when it cannot be
/// examined. "com.quill.logsmith.tlyd.database.corruptions": the count since the last report,
/// which restarts from 0; 0 when the functions that read and reset it cannot be resolved.
void reportDatabaseSize(TBReport& report);

/// "com.quill.usage.cur_boot_session_cpu_uptime": minutes awake since boot, −1 without the ratio of
/// the kernel's ticks.
void reportCPUUptime(TBReport& report);

}  // namespace vesprun
