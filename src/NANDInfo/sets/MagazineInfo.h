#pragma once

#include <cstdint>

#include "vesprun/PropertyDict.h"

namespace vesprun {

// What the entry points of "vesprun/Magazine.h" do.

PropertyDict gatherMagazineInfo(std::uint64_t hours, bool deltaWanted, std::uint32_t mode);
PropertyDict gatherMagazineHistory(bool skipHistory);

}  // namespace vesprun
