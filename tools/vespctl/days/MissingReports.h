#pragma once

#include <cstdint>
#include <vector>

#include "platform/host/HostPlatform.h"
#include "platform/host/outbox/DailyLogs.h"

namespace vesprun {

/// What `submitMissingReports` did, or would do.
struct MissingReports {
  std::vector<std::int32_t> submitted;
  std::vector<std::int32_t> failed;
  std::vector<UnreadableLog> unreadable;  ///< of which the day is not known
};

/// Submits, on the installed device, the reports of the last days, the day before yesterday the
/// last, that have a row and no daily log, neither in the outbox nor pruned: without the keys that
/// tell of the moment. A dry run submits none and changes nothing. Throws `CommandFailure` when
/// counters or outbox cannot be read.
MissingReports submitMissingReports(HostPlatform& device, std::uint32_t last, bool isDry);

}  // namespace vesprun
