#pragma once

#include "Export.h"

namespace vesprun {

/// Does the storage controller recommend deleting content? False when it cannot be asked; most
/// controllers lack the method and are not opened. Other failures are lines on standard error.
VESPRUN_EXPORT bool NandRecommendsContentDeletion() noexcept;

}  // namespace vesprun
