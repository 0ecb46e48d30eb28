#pragma once

#include <cstdint>
#include <optional>

#include "NANDInfo/controller/NandExporter.h"
#include "common/PropertyDict.h"

namespace vesprun {

// The storage controller's statistics as dictionaries. Every operation opens its own connection and
// has closed it and released every registry handle when it returns, whatever happened. Failures are
// recorded as the first error text (`SetAPIErrorMessage`) where nothing else is said.

/// Is this a day on which the statistics go to analytics events alone? It alternates from day
/// (UTC) to day, in a phase that the boot session decides; false when the session is not known.
bool NandInfoShouldLogAllToEH();

/// The FTL fields, each an unsigned 64-bit number: those of now, or those of a stats-magazine
/// snapshot `argument` hours back (not used with `useStatsSelector`). With them come two 32-bit
/// numbers that are 1 or 0: "com.quill.NANDInfo.IsQNS1Controller" and
/// "com.quill.NANDInfo.IsStatMagSupported". Nothing on failure.
std::optional<PropertyDict> gatherORUFTLData(bool useStatKeyParser, bool useStatsSelector,
                                             std::uint32_t argument);

/// The fields of each MSP under its index ("0", "1", up to "9"): those gathered before any failure.
/// Nothing when none answers or the controller has no such statistics.
std::optional<PropertyDict> gatherORUMSPData();

/// Fills a context, zeroed by the caller, with the base statistics. `exporter` becomes the
/// controller's table entry, or the ending one. False, with lines on the standard error stream when
/// the controller cannot be used, when the context was not filled or the connection did not close;
/// fields read before that may then remain in it.
bool GatherNANDStats(nand_exporter_t*& exporter, ORUStatsContext& context);

/// The legacy NAND info: keys that begin with "com.quill.NANDInfo.", in a fixed order, to numbers
/// of the type that their figure has: signed 32-bit for the driver version, unsigned 32-bit for the
/// export version and the geometry, unsigned 64-bit for all others (sums and differences wrap).
/// `omitVersionFields` leaves out the two versions and the demo mode.
PropertyDict CreateNANDInfoDict(const ORUStatsContext& context, bool omitVersionFields);

/// "HLT_Reclaimer_totalPurgeable" and "HLT_Reclaimer_totalNonPurgeable", each only when the
/// purgeable-space service gives it, as it gives it.
PropertyDict getReclaimerInfo();

}  // namespace vesprun
