#pragma once

#include <array>
#include <cstdint>

#include "NANDInfo/parsers/GenericParserCxt.h"

namespace vesprun {

/// The base parser's result: all decoded values, and a summary, 0 where no record fills it.
struct ORUStatsContext {
  GenericParserCxt fields;  ///< in buffer order

  std::uint32_t exportVersion = 0;  ///< 0 again when a parse fails
  std::int32_t driverVersion = 0;   ///< -1 once a parse has begun
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

/// A summary field, named as the statistic whose value it keeps.
struct ORUSummaryField {
  std::uint16_t id;
  std::uint32_t ORUStatsContext::*narrow;  ///< null when the field is 64 bits wide
  std::uint64_t ORUStatsContext::*wide;

  constexpr ORUSummaryField(std::uint16_t statistic, std::uint32_t ORUStatsContext::*field)
      : id(statistic), narrow(field), wide(nullptr) {}
  constexpr ORUSummaryField(std::uint16_t statistic, std::uint64_t ORUStatsContext::*field)
      : id(statistic), narrow(nullptr), wide(field) {}

  std::uint64_t get(const ORUStatsContext& ctx) const {
    return narrow != nullptr ? ctx.*narrow : ctx.*wide;
  }
  /// A narrow field keeps the low 32 bits.
  void set(ORUStatsContext& ctx, std::uint64_t value) const {
    if (narrow != nullptr) {
      ctx.*narrow = static_cast<std::uint32_t>(value);
    } else {
      ctx.*wide = value;
    }
  }
};

/// In the order of the context.
inline constexpr ORUSummaryField kORUSummaryFields[] = {
    {53, &ORUStatsContext::exportVersion},
    {52, &ORUStatsContext::numVirtualBlocks},
    {51, &ORUStatsContext::blocksPerVirtualBlock},
    {50, &ORUStatsContext::pagesPerVirtualBlock},
    {49, &ORUStatsContext::bytesPerPage},
    {7, &ORUStatsContext::hostReads},
    {4, &ORUStatsContext::hostWrites},
    {48, &ORUStatsContext::numFreeVirtualBlocks},
    {17, &ORUStatsContext::wearLevMoves},
    {19, &ORUStatsContext::nandReads},
    {18, &ORUStatsContext::nandWrites},
    {20, &ORUStatsContext::bandErases},
    {12, &ORUStatsContext::IND_pool_free},
    {13, &ORUStatsContext::IND_pool_count},
    {56, &ORUStatsContext::utilFormatTime},
    {28, &ORUStatsContext::numSleepOps},
    {45, &ORUStatsContext::maxHighEnduranceBlockErases},
};

/// Empties the fields and zeroes the summary.
void ORUReleaseContext(ORUStatsContext& ctx);

}  // namespace vesprun
