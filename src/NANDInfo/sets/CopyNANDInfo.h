#pragma once

#include "vesprun/CopyNANDInfo.h"

namespace vesprun {

/// Do today's statistics go to analytics events alone? Alternates by day (UTC), in a phase that
/// depends on the boot session; false when that is unknown.
bool NandInfoShouldLogAllToEH();

}  // namespace vesprun
