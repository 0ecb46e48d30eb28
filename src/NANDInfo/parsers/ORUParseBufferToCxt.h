#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/parsers/ORUStatsContext.h"

namespace vesprun {

/// Decodes the base statistics into `ctx`: fields of every known statistic in buffer order, and the
/// summary. Array fields are named by the statistic and an index from 0 (`ECBins0`). A field for
/// which memory runs out is missing.
///
/// True when the records fill the buffer's words exactly. False for less than one word; and, with
/// `exportVersion` 0 and earlier fields in `ctx`, at a header that is invalid or claims more words
/// than follow, or when overlapping records gave more fields than the buffer has words and more
/// than 262,144.
///
/// A statistic has its own number of values: further words of a record are skipped, missing ones
/// taken from the words after it, which are read again as records. Values beyond the buffer are
/// left out.
bool ORUParseBufferToCxt(ORUStatsContext& ctx, std::span<const std::uint8_t> buffer);

}  // namespace vesprun
