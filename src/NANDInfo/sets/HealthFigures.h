#pragma once

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// All health figures; empty, with the error recorded, without the FTL fields.
PropertyDict gatherNANDHealthInfo();

// The work of the entry points of "vesprun/HealthSets.h", which describes it. These throw.

PropertyDict gatherTendmarkInfo();
PropertyDict gatherOTAInfo();
PropertyDict gatherInternalLabInfo();

}  // namespace vesprun
