#pragma once

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The work of the entry point of "vesprun/VMFreezer.h", which describes it. This throws.
PropertyDict gatherVMFreezerInfo();

}  // namespace vesprun
