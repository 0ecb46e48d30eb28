#pragma once

#include <string_view>

namespace vesprun {

/// System-wide notifications, which carry a name and no data.
class NotificationCenter {
 public:
  virtual ~NotificationCenter() = default;

  virtual void PostNotification(std::string_view name) = 0;
};

}  // namespace vesprun
