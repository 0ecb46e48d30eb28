#pragma once

#include "vesprun/HealthSets.h"

namespace vesprun {

/// All health figures; empty, with the error recorded, without the FTL fields.
PropertyDict gatherNANDHealthInfo();

}  // namespace vesprun
