#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/parsers/GenericParserCxt.h"

namespace vesprun {

/// Decodes the MSP statistics and returns the number of elements added to `ctx`: one element under
/// the statistic's name, several under the name and an index from 0. Unknown keys are skipped.
///
/// A payload of a wrong size is recorded as an error (`SetAPIErrorMessage`), and its whole
/// elements, up to the statistic's number, are added. The walk ends at an end marker, a record
/// longer than the rest, less than a header or, with an error, when memory runs out; earlier
/// elements are kept and counted. An empty buffer is an error.
std::uint32_t ORUMSPParseBufferToCxt(GenericParserCxt& ctx, std::span<const std::uint8_t> buffer);

}  // namespace vesprun
