#pragma once

#include <optional>
#include <string>
#include <utility>

#include "platform/Clock.h"

namespace vesprun {

/// The machine's clock, or a stopped one.
class HostClock : public Clock {
 public:
  /// `timeZone`: a name of the time-zone database (`isTimeZone`); nothing: the process's.
  explicit HostClock(std::optional<Date> standingStillAt,
                     std::optional<std::string> timeZone = std::nullopt)
      : _standingStillAt(standingStillAt), _timeZone(std::move(timeZone)) {}

  Date now() override;
  /// The described zone is in the process's TZ meanwhile: the C library knows no other way.
  std::string localDateText(const Date& date) override;

 private:
  std::optional<Date> _standingStillAt;
  std::optional<std::string> _timeZone;
};

/// Whether the time-zone database has a zone of that name.
bool isTimeZone(const std::string& name);

}  // namespace vesprun
