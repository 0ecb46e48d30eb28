#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

/// Submits the document of a daily log as log "log-aggregated" of type "193". The header names the
/// previous OS version on the first log after it changed. What fails is left at an error line.
void submitDailyLog(const PropertyDict& document);

}  // namespace vesprun
