#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/parsers/ORUStatsContext.h"

namespace vesprun {

/// Decodes the base statistics of the storage controller into `ctx`, behind the fields that it
/// holds: the fields of every known statistic, in buffer order, and the values that the summary
/// names. An array's fields are named by the statistic and an index from 0 (`ECBins0`). A field for
/// which memory runs out is missing.
///
/// True when the records fill the buffer's words exactly. False for a buffer of less than one word.
/// False, with `exportVersion` 0 and what was decoded before in `ctx`, at the first header that is
/// invalid or claims more words than follow, and when records that overlap have given more fields
/// than the buffer has words, and more than 262,144.
///
/// The number of values is that of the statistic: words that a record holds beyond it are skipped,
/// and missing ones are taken from the words behind the record, which are also read as the records
/// they are. Values that would lie behind the buffer are left out.
bool ORUParseBufferToCxt(ORUStatsContext& ctx, std::span<const std::uint8_t> buffer);

}  // namespace vesprun
