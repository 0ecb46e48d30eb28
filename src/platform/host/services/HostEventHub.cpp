#include "platform/host/services/HostEventHub.h"

namespace vesprun {

bool HostEventHub::EventHubIsEventUsed(std::string_view event) {
  return !_description.used || _description.used->contains(event);
}

bool HostEventHub::EventHubSendEventLazy(std::string_view event, const PayloadBuilder& build) {
  if (!_description.available || _description.fails.contains(event)) {
    return false;
  }
  return !EventHubIsEventUsed(event) ||
         _outbox.append("events.jsonl", {{"event", event}, {"payload", build()}});
}

}  // namespace vesprun
