#pragma once

#include <cstdint>

#include "common/AppInfoList.h"

namespace vesprun {

/// The day before a day number, in 32 bits: before the smallest number comes the largest.
std::int32_t dayBefore(std::int32_t day);

/// Runs the daily tasks for yesterday unless they have run for it, or for a later day, already;
/// then stores yesterday as the day of the last run. A process that ends during the tasks leaves
/// the stored day as it was, so that the next one runs them again. `appInfo` may be null: none.
///
/// Of several processes one does the work, and the others wait for it and find it done. One that
/// has waited for minutes gives up; the system log then says so.
void runDayCheck(const AppInfoList* appInfo);

/// Runs the daily tasks for a day, whether or not they have run for it, when no other process is
/// at them (see `runDayCheck`). Every task is run, whatever the earlier ones did. `appInfo`, null
/// for none, goes into the daily log. When this returns, the counters that the tasks wrote are
/// durable.
void runDailyTasks(std::int32_t day, const AppInfoList* appInfo);

}  // namespace vesprun
