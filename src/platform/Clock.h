#pragma once

#include <string>

#include "common/Calendar.h"

namespace vesprun {

/// The device's calendar clock.
class Clock {
 public:
  virtual ~Clock() = default;

  virtual Date now() = 0;

  /// `date` in the device's time zone: "yyyy-MM-dd HH:mm:ss Z" with an offset such as +0100.
  virtual std::string localDateText(const Date& date) = 0;
};

}  // namespace vesprun
