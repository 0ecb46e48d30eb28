#pragma once

#include <string_view>
#include <vector>

#include "report/TBReport.h"

namespace vesprun {

/// 28 memory statistics of the kernel; see docs/daily-log.md.
void reportVMStats(TBReport& report);

/// All their keys, including those that this device lacks.
std::vector<std::string_view> vmStatisticKeys();

}  // namespace vesprun
