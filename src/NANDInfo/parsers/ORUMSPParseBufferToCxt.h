#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/parsers/GenericParserCxt.h"

namespace vesprun {

/// Decodes the MSP statistics of the storage controller and returns the number of elements added to
/// `ctx`. A statistic of one element is named by its name, each of several by the name and an index
/// from 0. Unknown keys are skipped.
///
/// A payload of another size than the statistic's is recorded as an error (`SetAPIErrorMessage`);
/// the whole elements that it holds are added, up to the statistic's number. An end marker, a
/// record longer than what remains, less than a header, and, as an error, elements for which memory
/// runs out end the walk; what was added before stays and counts. An empty buffer is an error.
std::uint32_t ORUMSPParseBufferToCxt(GenericParserCxt& ctx, std::span<const std::uint8_t> buffer);

}  // namespace vesprun
