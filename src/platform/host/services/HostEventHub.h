#pragma once

#include "platform/EventHub.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/Outbox.h"

namespace vesprun {

/// The event service: what it takes stands in `outbox/events.jsonl`.
class HostEventHub : public EventHub {
 public:
  HostEventHub(const EventHubDescription& description, Outbox& outbox)
      : _description(description), _outbox(outbox) {}

  bool sendEventLazyIsAvailable() override { return _description.available; }
  bool EventHubIsEventUsed(std::string_view event) override;
  bool EventHubSendEventLazy(std::string_view event, const PayloadBuilder& build) override;

 private:
  const EventHubDescription& _description;
  Outbox& _outbox;
};

}  // namespace vesprun
