#pragma once

#include "common/AppInfoList.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// Logged, at error level, when the diagnostics service does not take the log.
inline constexpr const char* kSubmissionFailed = "Failed to write aggregated log";

/// False, with an error line, when no document can carry the daily log.
bool canSerializeDailyLog(const PropertyDict& document, const AppInfoList* appInfo = nullptr);

/// Submits the daily log as "log-aggregated" of type "193", with the active apps when they were
/// delivered. On the first log after the OS version changed, a header names the previous one.
/// False, with an error line, when that failed or the log cannot be serialized.
bool submitDailyLog(const PropertyDict& document, const AppInfoList* appInfo = nullptr);

}  // namespace vesprun
