#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

namespace vesprun {

inline constexpr std::size_t kNandChannelCounterCount = 177;

/// The counters of one NAND bus. What stands where:
///
/// | Words | Field |
/// |---|---|
/// | 0-32 | readStage[0-32] |
/// | 33-55 | initialReadStage[0-22] |
/// | 56-63 | nandStageOfLife[0-7] |
/// | 64 | not used |
/// | 65-102 | dspExceptionParameter[0-37] |
/// | 103-114 | readStage18NumOfErrorsBin[0-11] |
/// | 115-124 | readStage9NumOfErrorsBin[0-9] |
/// | 125-134 | readStage10NumOfErrorsBin[0-9] |
/// | 135-144 | readStage17NumOfErrorsBin[0-9] |
/// | 145-156 | readStage19NumOfErrorsBin[0-11] |
/// | 157-164 | algoNANDAccessesBin[0-7] |
/// | 165-176 | retentionIndication[0-11] |
using NandChannelCounters = std::array<std::uint32_t, kNandChannelCounterCount>;

}  // namespace vesprun
