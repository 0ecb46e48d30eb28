#pragma once

#include "../Export.h"

namespace vesprun {

/// Does the storage controller recommend deleting content? False when it cannot be asked: most
/// controllers have no such method, and are not opened. Other failures are lines on the standard
/// error stream.
VESPRUN_EXPORT bool NandRecommendsContentDeletion() noexcept;

}  // namespace vesprun
