#pragma once

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// What the entry point of "vesprun/VMFreezer.h" does.
PropertyDict gatherVMFreezerInfo();

}  // namespace vesprun
