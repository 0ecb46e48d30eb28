#pragma once

#include <optional>
#include <string>

#include "platform/Clock.h"

namespace vesprun {

/// The machine's clock, or one that stands still.
class HostClock : public Clock {
 public:
  explicit HostClock(std::optional<Date> standingStillAt) : _standingStillAt(standingStillAt) {}

  Date now() override;
  /// Local times follow the process's time zone (see `ProcessTimeZone`).
  std::string localDateText(const Date& date) override;

 private:
  std::optional<Date> _standingStillAt;
};

/// The time zone of a process, as long as the object lives. Local times are those of the whole
/// process: `set` changes its environment variable TZ, which no other thread may read meanwhile.
class ProcessTimeZone {
 public:
  ProcessTimeZone() = default;
  ProcessTimeZone(ProcessTimeZone&& other) noexcept;
  ProcessTimeZone& operator=(ProcessTimeZone&&) = delete;
  /// Brings back the zone that was there before `set`.
  ~ProcessTimeZone();

  /// Makes `name`, of the time-zone database, the time zone. False when the database has no such
  /// zone; nothing is changed then.
  bool set(const std::string& name);

 private:
  bool _isSet = false;
  std::optional<std::string> _before;
};

}  // namespace vesprun
