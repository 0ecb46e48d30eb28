#pragma once

#include "NANDInfo/HealthSets.h"

namespace vesprun {

/// All figures on the storage's health, of which the sets for other programs are made. Empty, with
/// the error recorded, when the FTL fields cannot be had.
PropertyDict gatherNANDHealthInfo();

}  // namespace vesprun
