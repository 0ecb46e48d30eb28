#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/host/HostPlatform.h"

namespace vesprun {

/// Something that an administrator should know of.
struct Finding {
  std::string_view finding;
  std::string detail;  ///< for people: the place, and what to type
};

struct DeviceStatus {
  struct Report {
    std::int32_t day;
    std::string log;  ///< the name of its file
  };

  std::string device;  ///< the name under which its logs are exported
  std::int32_t today = 0;
  std::optional<Report> lastReport;  ///< the newest
  std::int64_t nextReport = 0;       ///< the day that the next daily run reports
  std::int64_t keysToday = 0;
  std::uint64_t outboxBytes = 0;
  std::optional<std::string> whitelist;  ///< its digest; nothing without a usable one
  std::vector<Finding> findings;         ///< each kind once at most, in a fixed order
};

/// Whether all is well on the installed device, which was opened without changing it. Throws
/// `CommandFailure` when the outbox cannot be read.
DeviceStatus readStatus(HostPlatform& device);

}  // namespace vesprun
