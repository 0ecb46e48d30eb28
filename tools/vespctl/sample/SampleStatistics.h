#pragma once

#include <cstdint>

#include "common/Date.h"
#include "common/PropertyValue.h"

namespace vesprun {

// The buffers of the sample controller, as its driver sends them.

inline constexpr std::uint32_t kSampleNandDescription = 0x2A0442;
inline constexpr std::uint32_t kSampleBuses = 4;
inline constexpr std::uint32_t kSampleMSPs = 2;

/// Base and FTL statistics (one buffer serves both) as they stood `hoursBack` hours before `now`;
/// every counter has risen evenly. Every known statistic is there: those that count what a healthy
/// device does not meet are 0.
Bytes sampleStatistics(const Date& now, std::uint64_t hoursBack);

/// The statistics of one MSP.
Bytes sampleMSPStatistics(std::uint32_t index);

/// The telemetry list of a kind: a block of counters and an entry for each bus.
Bytes sampleTelemetry(std::uint32_t kind);

/// How much of each band is valid, by list.
Bytes sampleValidity();

/// The blocks that were bad from the factory.
Bytes sampleDefects();

}  // namespace vesprun
