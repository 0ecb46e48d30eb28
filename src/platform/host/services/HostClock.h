#pragma once

#include <optional>
#include <string>

#include "platform/Clock.h"

namespace vesprun {

/// The machine's clock, or a stopped one.
class HostClock : public Clock {
 public:
  explicit HostClock(std::optional<Date> standingStillAt) : _standingStillAt(standingStillAt) {}

  Date now() override;
  /// In the process's time zone (`ProcessTimeZone`).
  std::string localDateText(const Date& date) override;

 private:
  std::optional<Date> _standingStillAt;
};

/// The process's time zone as long as the object lives: `set` changes TZ, which no other thread may
/// read meanwhile.
class ProcessTimeZone {
 public:
  ProcessTimeZone() = default;
  ProcessTimeZone(const ProcessTimeZone&) = delete;
  ProcessTimeZone& operator=(const ProcessTimeZone&) = delete;
  /// Restores the zone from before `set`.
  ~ProcessTimeZone();

  /// Sets a zone of the time-zone database; false, and nothing changed, when there is none of that
  /// name.
  bool set(const std::string& name);

 private:
  bool _isSet = false;
  std::optional<std::string> _before;
};

}  // namespace vesprun
