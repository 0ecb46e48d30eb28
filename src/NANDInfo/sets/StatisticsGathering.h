#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "NANDInfo/controller/NandExporter.h"
#include "common/PropertyDict.h"

namespace vesprun {

// Fetches and parses the controller's statistics. Failures are recorded with `SetAPIErrorMessage`
// unless stated otherwise.

inline constexpr std::string_view kIsStatMagSupportedKey = "com.quill.NANDInfo.IsStatMagSupported";

/// The FTL fields, unsigned 64-bit numbers: those of now (`useStatsSelector`), or of the
/// stats-magazine snapshot `argument` hours back. Two 32-bit numbers, 1 or 0, come with them:
/// "com.quill.NANDInfo.IsQNS1Controller" and `kIsStatMagSupportedKey`. Nothing on failure.
std::optional<PropertyDict> gatherORUFTLData(bool useStatKeyParser, bool useStatsSelector,
                                             std::uint32_t argument);

/// The fields of each MSP by index ("0" to "9"), as far as they could be gathered. Nothing when no
/// MSP answers or the controller has no such statistics.
std::optional<PropertyDict> gatherORUMSPData();

/// Fills a zeroed context with the base statistics. `exporter` becomes the controller's table
/// entry, or the ending one. False, with lines on standard error when the controller cannot be
/// used, if the context was not filled or closing failed; it may then hold some fields.
bool GatherNANDStats(nand_exporter_t*& exporter, ORUStatsContext& context);

}  // namespace vesprun
