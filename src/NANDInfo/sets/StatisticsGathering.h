#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string_view>

#include "NANDInfo/controller/NandExporter.h"
#include "NANDInfo/parsers/GenericParserCxt.h"
#include "NANDInfo/tables/FieldTable.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

// Fetches and parses the controller's statistics. Failures are recorded with `SetAPIErrorMessage`
// unless stated otherwise.

inline constexpr std::string_view kIsStatMagSupportedKey = "com.quill.NANDInfo.IsStatMagSupported";

/// The FTL fields of a controller.
struct FTLFields {
  const GenericParserCxt& fields;
  bool isQNS1Controller;
  bool isStatMagSupported;
};

/// Calls `take` with the FTL fields of now (`useStatsSelector`), or of the stats-magazine snapshot
/// `argument` hours back. False, and no call, on failure.
bool gatherFTLFields(bool useStatKeyParser, bool useStatsSelector, std::uint32_t argument,
                     const std::function<void(const FTLFields&)>& take);

/// All of these fields as unsigned 64-bit numbers, with two 32-bit numbers, 1 or 0:
/// "com.quill.NANDInfo.IsQNS1Controller" and `kIsStatMagSupportedKey`. Nothing on failure.
std::optional<PropertyDict> gatherORUFTLData(bool useStatKeyParser, bool useStatsSelector,
                                             std::uint32_t argument);

/// The fields of each MSP by index ("0" to "9"), as far as they could be gathered: all, or those of
/// `digits`, rounded on request (`CreateFilteredDict_SigDig`). Nothing when no MSP answers or the
/// controller has no such statistics.
std::optional<PropertyDict> gatherORUMSPData(const FieldTable* digits = nullptr,
                                             bool round = false);

/// Fills a zeroed context with the base statistics. `exporter` becomes the controller's table
/// entry, or the ending one. False when the controller cannot be used, with lines on standard
/// error, or when the statistics cannot be parsed, which may leave some fields in the context.
bool GatherNANDStats(nand_exporter_t*& exporter, ORUStatsContext& context);

}  // namespace vesprun
