#pragma once

#include <string_view>
#include <vector>

#include "report/TBReport.h"

namespace vesprun {

/// 28 memory statistics of the kernel; see docs/daily-log.md.
void reportVMStats(TBReport& report);

/// Their keys, whether or not this device has them.
std::vector<std::string_view> vmStatisticKeys();

}  // namespace vesprun
