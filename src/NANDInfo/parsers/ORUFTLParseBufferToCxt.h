#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/parsers/GenericParserCxt.h"

namespace vesprun {

/// Decodes the FTL statistics, framed as the base statistics, and returns the number of fields
/// taken. Fields are appended in buffer order:
///
/// - a single value under the statistic's name, whatever else the record holds;
/// - an array as name, underscore and index from 0 (`hostWriteLogHisto_0`), as many elements as
///   both record and array have; a lone one is named `qosPerCmdQ_`. A wrong length is recorded as
///   an error;
/// - an unknown id, such as 900, as `Stat_900`, or `Stat_900_0` and so on when there are several.
///
/// Records without payload are skipped. The first invalid header (id 0xFFFF or above 0x30000000, or
/// more words than follow) silently ends the walk. With an error, so do an array for which memory
/// runs out and an unknown id with more than 65,535 words. Earlier fields are kept and counted.
/// Errors are recorded with `SetAPIErrorMessage`.
std::uint32_t ORUFTLParseBufferToCxt(GenericParserCxt& ctx, std::span<const std::uint8_t> buffer);

/// The same, as if all ids were unknown.
std::uint32_t ORUFTLParseStatKeyBufferToCxt(GenericParserCxt& ctx,
                                            std::span<const std::uint8_t> buffer);

}  // namespace vesprun
