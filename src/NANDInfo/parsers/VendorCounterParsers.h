#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "NANDInfo/parsers/NandChannelCounters.h"

namespace vesprun {

inline constexpr std::size_t kCounterRegionWords = 1024;
inline constexpr std::size_t kCounterRegionSize = kCounterRegionWords * sizeof(std::uint32_t);

/// The raw counters of a NAND bus: 32-bit little-endian words at any address.
using CounterRegion = std::span<const std::uint8_t, kCounterRegionSize>;

// The place of a counter depends on the flash. Each parser copies the words of one layout into
// `out`, zeroes those that the layout certainly lacks, and leaves the others: the caller zeroes
// `out` first.

/// The layout of the KX3 chip.
void parseCountersAlgoGeneric(CounterRegion region, NandChannelCounters& out);
/// The layout of the KX4 chip.
void parseCountersAlgoGenericKX4(CounterRegion region, NandChannelCounters& out);
/// The layouts of 1y and 1x flash.
void parseCounters1y(CounterRegion region, NandChannelCounters& out);
void parseCounters1xSandisk(CounterRegion region, NandChannelCounters& out);
void parseCounters1xHynix(CounterRegion region, NandChannelCounters& out);

/// Used by the first two.
void parseOnlyAlgoGenericCounters(CounterRegion region, NandChannelCounters& out);
void parseOnlyAlgoGenericCountersKX4(CounterRegion region, NandChannelCounters& out);

}  // namespace vesprun
