#pragma once

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// All health figures; empty, with the error recorded, without the FTL fields.
PropertyDict gatherNANDHealthInfo();

// What the entry points of "vesprun/HealthSets.h" do.

PropertyDict gatherTendmarkInfo();
PropertyDict gatherOTAInfo();
PropertyDict gatherInternalLabInfo();

}  // namespace vesprun
