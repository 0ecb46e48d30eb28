#pragma once

#include "NANDInfo/CopyNANDInfo.h"

namespace vesprun {

/// Is this a day on which the statistics go to analytics events alone? It alternates from day
/// (UTC) to day, in a phase that the boot session decides; false when the session is not known.
bool NandInfoShouldLogAllToEH();

}  // namespace vesprun
