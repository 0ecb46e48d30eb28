#pragma once

#include "platform/Platform.h"

namespace vesprun {

/// Logs an entry of a telemetry or defect list.
inline void logListRecord(const PropertyDict& record) {
  platform().logsmith().FLLogStructuredData(176, record);
}

}  // namespace vesprun
