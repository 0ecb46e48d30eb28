#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "NANDInfo/controller/NandExporter.h"
#include "common/PropertyDict.h"

namespace vesprun {

// Fetches the controller's statistics and has them parsed. Failures are recorded as the first error
// text (`SetAPIErrorMessage`) where nothing else is said.

inline constexpr std::string_view kIsStatMagSupportedKey = "com.quill.NANDInfo.IsStatMagSupported";

/// The FTL fields, each an unsigned 64-bit number: those of now, or those of a stats-magazine
/// snapshot `argument` hours back (not used with `useStatsSelector`). With them come two 32-bit
/// numbers that are 1 or 0: "com.quill.NANDInfo.IsQNS1Controller" and `kIsStatMagSupportedKey`.
/// Nothing on failure.
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

}  // namespace vesprun
