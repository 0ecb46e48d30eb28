#pragma once

#include "report/TBReport.h"

namespace vesprun {

/// 28 memory statistics of the kernel; see docs/daily-log.md.
void reportVMStats(TBReport& report);

}  // namespace vesprun
