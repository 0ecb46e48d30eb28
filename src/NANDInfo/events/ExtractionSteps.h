#pragma once

#include <cstdint>
#include <optional>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// What the entry point of "vesprun/EventExtraction.h" does.
std::optional<PropertyDict> runExtractionSteps(bool allowMonthly, bool collectResults,
                                               std::uint32_t firstStep);

}  // namespace vesprun
