#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

/// The usage and write counters of the device's NVRAM, as the registry has them: "commonused",
/// "systemused", "norwrites" and "version", each only when the registry has it on the service
/// "DevRegDTNVRAMDiags" or below.
///
/// When there is at least one, they are offered as the event
/// "com.quill.massStorage.NANDInfo.NORWrites" as well; whether the event service takes it, or can
/// send at all, makes no difference to the result.
PropertyDict gatherNVRAMStats();

}  // namespace vesprun
