#pragma once

#include <ostream>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// Writes a daily log for people: its day, metadata, scalars, and each distribution with its
/// figures and a histogram drawn in text.
void showDailyLog(std::ostream& out, const PropertyDict& log);

}  // namespace vesprun
