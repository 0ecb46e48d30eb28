#pragma once

namespace vesprun {

/// Writes the storage controller's lists to the structured-data log: the band validity list when it
/// is wanted, three telemetry lists and the factory defects. Works out the write amplification
/// first and leaves it, with the decision on the validity list, in the state of
/// `StructuredLogState.h`.
///
/// `callersFlag` is passed on to the controller in each request. False, with lines on the standard
/// error stream, when the controller, its connection or its properties cannot be had, when it has
/// no selector for a list that it offers, or when a list could not be handled. A list that the
/// controller does not deliver costs only a line. Its connection is closed and every registry
/// handle released, whatever happened.
bool DumpStorageStructuredLog(bool callersFlag);

}  // namespace vesprun
