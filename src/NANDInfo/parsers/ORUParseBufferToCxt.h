#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/parsers/ORUStatsContext.h"

namespace vesprun {

/// Decodes the base statistics of the storage controller into `ctx`: appends the fields of every
/// record of a known statistic, in buffer order, and keeps the values that the summary names. An
/// array's fields are named by the statistic and an index from 0 (`ECBins0`). Unknown ids are
/// stepped over. Fields that `ctx` holds already stay.
///
/// True when the records fill the buffer's words exactly. False for a buffer of less than one word,
/// and at the first header that is invalid or claims more words than follow: then `exportVersion`
/// is 0, and what was decoded before stays in `ctx`. So it is, too, when a buffer has given more
/// fields than it has words, and more than 262,144, as overlapping records can. A field for which
/// memory runs out is missing.
///
/// How many values a statistic has is fixed; what a record holds beyond them is stepped over. A
/// record that holds fewer takes the missing ones from the words behind it, which are also read as
/// the records they are. Values that would lie behind the end of the buffer are left out, from the
/// fields and from the summary.
bool ORUParseBufferToCxt(ORUStatsContext& ctx, std::span<const std::uint8_t> buffer);

}  // namespace vesprun
