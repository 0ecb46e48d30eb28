#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "NANDInfo/parsers/NandChannelCounters.h"

namespace vesprun {

inline constexpr std::size_t kCounterRegionWords = 1024;
inline constexpr std::size_t kCounterRegionSize = kCounterRegionWords * sizeof(std::uint32_t);

/// The raw counters of one NAND bus: 32-bit little-endian words, at any address.
using CounterRegion = std::span<const std::uint8_t, kCounterRegionSize>;

// Where a counter stands in its region depends on the flash part. Each of these copies the words of
// one layout into `out`, sets to 0 what the layout is known not to have, and leaves all other words
// as they are: the caller fills `out` with zeros first.

/// The layout of the KX3 chip.
void parseCountersAlgoGeneric(CounterRegion region, NandChannelCounters& out);
/// The layout of the KX4 chip.
void parseCountersAlgoGenericKX4(CounterRegion region, NandChannelCounters& out);
/// The layouts of 1y and 1x flash.
void parseCounters1y(CounterRegion region, NandChannelCounters& out);
void parseCounters1xSandisk(CounterRegion region, NandChannelCounters& out);
void parseCounters1xHynix(CounterRegion region, NandChannelCounters& out);

/// The work of the first two.
void parseOnlyAlgoGenericCounters(CounterRegion region, NandChannelCounters& out);
void parseOnlyAlgoGenericCountersKX4(CounterRegion region, NandChannelCounters& out);

}  // namespace vesprun
