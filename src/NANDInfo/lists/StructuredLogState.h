#pragma once

#include "NANDInfo/StructuredLogState.h"

namespace vesprun {

/// The type of the records that the handlers of telemetry and defect lists write.
inline constexpr std::int32_t kListRecordType = 176;

/// All four 0, as in a new process.
void forgetStructuredLogState();

}  // namespace vesprun
