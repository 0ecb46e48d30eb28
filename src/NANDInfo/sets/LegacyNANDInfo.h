#pragma once

#include <optional>

#include "vesprun/PropertyDict.h"

namespace vesprun {

// The work of the entry points of "vesprun/CopyNANDInfo.h", which describes it. These throw.

PropertyDict gatherNANDInfo();
std::optional<PropertyDict> gatherNANDInfoForDailyLog();
void addNANDInfo(PropertyDict& info);

/// Do today's statistics go to analytics events alone? Alternates by day (UTC), in a phase that
/// depends on the boot session; false when that is unknown.
bool NandInfoShouldLogAllToEH();

}  // namespace vesprun
