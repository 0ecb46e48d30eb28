#pragma once

#include <cstdint>
#include <optional>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The work of the entry point of "vesprun/EventExtraction.h", which describes it. This throws.
std::optional<PropertyDict> runExtractionSteps(bool allowMonthly, bool collectResults,
                                               std::uint32_t firstStep);

}  // namespace vesprun
