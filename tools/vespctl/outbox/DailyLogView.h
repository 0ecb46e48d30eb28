#pragma once

#include <ostream>

#include "common/PropertyDict.h"

namespace vesprun {

/// Writes an aggregated daily log as a person reads it: what it covers, metadata, scalars, and each
/// distribution with its figures and its histogram drawn in text.
void showDailyLog(std::ostream& out, const PropertyDict& log);

}  // namespace vesprun
