#pragma once

#include <cstdint>

#include "vesprun/PropertyDict.h"

namespace vesprun {

// The work of the entry points of "vesprun/Magazine.h", which describes it. These throw.

PropertyDict gatherMagazineInfo(std::uint64_t hours, bool deltaWanted, std::uint32_t mode);
PropertyDict gatherMagazineHistory(bool skipHistory);

}  // namespace vesprun
