#pragma once

#include <cstdint>
#include <string>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// A daily log in the text form of metrics that a textfile collector reads. A distribution without
/// a histogram, or whose labels are not numeric, is a summary.
std::string metricsText(std::int32_t day, const PropertyDict& document);

}  // namespace vesprun
