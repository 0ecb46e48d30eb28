#pragma once

#include <optional>

#include "vesprun/PropertyDict.h"

namespace vesprun {

// The work of the entry points of "vesprun/WhitelistedFieldSets.h", which describes it. These
// throw.

std::optional<PropertyDict> gatherFTLInfo(bool useStatKeyParser);
PropertyDict gatherWhitelistedFTLInfo(bool round);
PropertyDict gatherWhitelistedMSPInfo(bool round);
PropertyDict gatherWhitelistedStorageStats(bool round);

}  // namespace vesprun
