#pragma once

#include <cstdint>

namespace vesprun {

/// The type of the structured records that the handlers of the lists log.
inline constexpr std::int32_t kListRecordType = 176;

/// Logs the storage controller's lists: the band validity list when it is wanted, three telemetry
/// lists and the factory defects. First leaves the write amplification, and whether the validity
/// list is wanted, in the state of `StructuredLogState.h`. `callersFlag` goes to the controller.
///
/// False, with lines on standard error, when the controller, its connection, its properties or a
/// selector cannot be had, or a list cannot be handled. A list that the controller does not deliver
/// is only a line.
bool DumpStorageStructuredLog(bool callersFlag);

}  // namespace vesprun
