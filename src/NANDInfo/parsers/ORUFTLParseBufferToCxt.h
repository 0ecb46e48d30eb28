#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/parsers/GenericParserCxt.h"

namespace vesprun {

/// Decodes the FTL statistics of the storage controller, which are framed as the base statistics
/// are, and returns the number of fields taken. Fields are appended in buffer order:
///
/// - a single value under the statistic's name, whatever else the record holds;
/// - an array under the name, an underscore and an index from 0 (`hostWriteLogHisto_0`), as many
///   elements as both the record and the array have; a lone one is named `qosPerCmdQ_`. A record of
///   another length than the array's is recorded as an error;
/// - an unknown id, 900 say, as `Stat_900`, or as `Stat_900_0` and so on when there are several.
///
/// A record without payload is skipped. The first invalid header (the id 0xFFFF, or one above
/// 0x30000000, or more words than follow) quietly ends the walk. So does, as an error, an array for
/// which memory runs out and a record of an unknown id with more than 65,535 words. What was taken
/// before stays and counts. Errors are recorded as `SetAPIErrorMessage` does.
std::uint32_t ORUFTLParseBufferToCxt(GenericParserCxt& ctx, std::span<const std::uint8_t> buffer);

/// The same walk, naming every record by its id as if all were unknown.
std::uint32_t ORUFTLParseStatKeyBufferToCxt(GenericParserCxt& ctx,
                                            std::span<const std::uint8_t> buffer);

}  // namespace vesprun
