#pragma once

#include <optional>

#include "vesprun/PropertyDict.h"

namespace vesprun {

// What the entry points of "vesprun/WhitelistedFieldSets.h" do.

std::optional<PropertyDict> gatherFTLInfo(bool useStatKeyParser);
PropertyDict gatherWhitelistedFTLInfo(bool round);
PropertyDict gatherWhitelistedMSPInfo(bool round);
PropertyDict gatherWhitelistedStorageStats(bool round);

}  // namespace vesprun
