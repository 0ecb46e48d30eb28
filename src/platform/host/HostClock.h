#pragma once

#include <optional>

#include "platform/Clock.h"

namespace vesprun {

/// The machine's clock, or one that stands still.
class HostClock : public Clock {
 public:
  explicit HostClock(std::optional<Date> standingStillAt) : _standingStillAt(standingStillAt) {}

  Date now() override;
  /// Local times follow the process's time zone (see `useTimeZone`).
  std::string localDateText(const Date& date) override;

 private:
  std::optional<Date> _standingStillAt;
};

/// Makes `name`, of the time-zone database, the time zone of the whole process, or the machine's
/// own when there is none: it sets, or removes, the environment variable TZ. False when the
/// database has no such zone.
bool useTimeZone(const std::optional<std::string>& name);

}  // namespace vesprun
