#pragma once

namespace vesprun {

/// Logs the storage controller's lists: the band validity list when it is wanted, three telemetry
/// lists and the factory defects. First works out the write amplification and leaves it, with the
/// decision on the validity list, in the state of `StructuredLogState.h`.
///
/// `callersFlag` goes to the controller in each request. False, with lines on standard error, when
/// the controller, its connection or its properties cannot be had, when it lacks a selector for a
/// list that it offers, or when a list could not be handled. A list that is not delivered costs
/// only a line. Everything is closed and released in any case.
bool DumpStorageStructuredLog(bool callersFlag);

}  // namespace vesprun
