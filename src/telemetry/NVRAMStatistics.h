#pragma once

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The usage and write counters of the NVRAM: "commonused", "systemused", "norwrites" and
/// "version", as far as the registry has them on the service "DevRegDTNVRAMDiags" or below.
///
/// If there are any, they are also offered as the event "com.quill.massStorage.NANDInfo.NORWrites",
/// with no effect on the result.
PropertyDict gatherNVRAMStats();

}  // namespace vesprun
