#pragma once

namespace vesprun {

/// Moves up to 10 ECC events of the kernel to structured log records of type 172: "id", "count" and
/// "reg0" to "reg7", as many registers as "count" says, at most 8. A full run takes an 11th event,
/// which is dropped. An event leaves the queue when its record is written; one that cannot be
/// written ends the run.
///
/// Logs the error number of the last read, at default level, unless it is 0, 2 (queue empty) or 16
/// (busy).
void LogKernelECCEvents();

}  // namespace vesprun
