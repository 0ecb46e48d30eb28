#pragma once

#include <cstdint>

#include "common/Calendar.h"
#include "common/PropertyValue.h"

namespace vesprun {

// The buffers of the sample controller, as its driver sends them. All are made of the same few
// figures, so they agree with each other.

/// Base and FTL statistics (one buffer serves both) as they were `hoursBack` hours before `now`;
/// every counter has risen evenly. Counters of what a healthy device does not meet are 0.
Bytes sampleStatistics(const Date& now, std::uint64_t hoursBack);

/// The statistics of one MSP.
Bytes sampleMSPStatistics(std::uint64_t index);

/// The telemetry list of a kind: a block of counters and an entry for each bus.
Bytes sampleTelemetry(std::uint32_t kind);

/// How much of each band is valid, by list.
Bytes sampleValidity();

/// The blocks that were bad from the factory.
Bytes sampleDefects();

}  // namespace vesprun
