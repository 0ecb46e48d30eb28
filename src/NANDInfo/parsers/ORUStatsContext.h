#pragma once

#include <array>
#include <cstdint>

#include "NANDInfo/parsers/GenericParserCxt.h"

namespace vesprun {

/// What the base parser fills: every decoded value, and the few that reports name. A summary field
/// that no record fills stays 0.
struct ORUStatsContext {
  GenericParserCxt fields;  ///< in buffer order

  std::uint32_t exportVersion = 0;  ///< 0 again when a parse fails
  std::int32_t driverVersion = 0;   ///< -1 from the start of a parse on; no statistic fills it
  std::uint32_t numVirtualBlocks = 0;
  std::uint32_t blocksPerVirtualBlock = 0;
  std::uint32_t pagesPerVirtualBlock = 0;
  std::uint32_t bytesPerPage = 0;
  std::uint64_t hostReads = 0;
  std::uint64_t hostWrites = 0;
  std::uint64_t numFreeVirtualBlocks = 0;
  std::uint64_t wearLevMoves = 0;
  std::uint64_t nandReads = 0;
  std::uint64_t nandWrites = 0;
  std::uint64_t bandErases = 0;
  std::uint64_t IND_pool_free = 0;
  std::uint64_t IND_pool_count = 0;
  std::uint64_t utilFormatTime = 0;  ///< seconds since 1970-01-01 UTC
  std::uint64_t numSleepOps = 0;
  std::uint64_t maxHighEnduranceBlockErases = 0;
  std::array<std::uint64_t, 5> readCountHisto{};
};

/// Empties the field list and sets every summary field to 0.
void ORUReleaseContext(ORUStatsContext& ctx);

}  // namespace vesprun
