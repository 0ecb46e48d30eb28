#pragma once

#include "Export.h"

namespace vesprun {

// Input and results of the daily structured storage log, false or 0 in a new process.

/// True: always collect the validity list.
VESPRUN_EXPORT void SetForceCollection(bool force) noexcept;

/// Whether the last structured log wanted the validity list.
VESPRUN_EXPORT bool NeedsValidityList() noexcept;
/// Write amplification of the user partition at the last structured log, in single precision.
VESPRUN_EXPORT double CurrentUserWriteAmplification() noexcept;
/// Of the intermediate partition.
VESPRUN_EXPORT double CurrentSystemWriteAmplification() noexcept;

}  // namespace vesprun
