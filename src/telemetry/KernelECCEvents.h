#pragma once

namespace vesprun {

/// Moves up to 10 events from the kernel's queue of ECC events to structured-data log records of
/// type 172: "id", "count" and "reg0" to "reg7", as many registers as the event counts (at most the
/// 8 that it holds; "count" stays as it is). A full run takes an 11th event, which is not logged.
/// An event leaves the queue when its record is written; one that cannot be written ends the run.
///
/// Then an error number other than 2 (queue empty) and 16 (busy) is told in the system log at the
/// default level: that of the last read, which is 0 when the run ended at its limit.
void LogKernelECCEvents();

}  // namespace vesprun
