#pragma once

#include <cstdint>

#include "common/AppInfoList.h"

namespace vesprun {

/// In 32 bits: before the smallest number comes the largest.
std::int32_t dayBefore(std::int32_t day);

/// Runs the daily tasks for yesterday unless they have run for it or a later day, then stores
/// yesterday. A process that ends earlier leaves the stored day: the next one runs them again.
/// `appInfo` may be null.
///
/// One process does the work; the others wait and find it done, or give up after minutes with a
/// line in the system log.
void runDayCheck(const AppInfoList* appInfo);

/// Runs the daily tasks for a day, even if they have run, unless another process is at them (see
/// `runDayCheck`). Every task runs, whatever the earlier ones did. When this returns, their
/// counters are durable. `appInfo` goes into the daily log and may be null.
void runDailyTasks(std::int32_t day, const AppInfoList* appInfo);

}  // namespace vesprun
