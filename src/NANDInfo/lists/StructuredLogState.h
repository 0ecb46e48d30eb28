#pragma once

#include "NANDInfo/StructuredLogState.h"

namespace vesprun {

/// All four 0, as in a new process.
void forgetStructuredLogState();

}  // namespace vesprun
