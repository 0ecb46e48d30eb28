#pragma once

#include <functional>
#include <string_view>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The platform's analytics events and notifications.
class EventHub {
 public:
  using PayloadBuilder = std::function<PropertyDict()>;

  virtual ~EventHub() = default;

  /// False on a system that lacks the send operation.
  virtual bool sendEventLazyIsAvailable() = 0;

  /// True when the service wants the event.
  virtual bool EventHubIsEventUsed(std::string_view event) = 0;

  /// Offers an event. `build` is called before this returns, and only when the service wants the
  /// event and can send. True when the service took the offer, even of an event that it does not
  /// want.
  virtual bool EventHubSendEventLazy(std::string_view event, const PayloadBuilder& build) = 0;

  /// Posts a system-wide notification, which carries no data.
  virtual void PostNotification(std::string_view name) = 0;
};

}  // namespace vesprun
